#include "http/detail/Loggers.hpp"

namespace velkor::http::detail {

const common::DiagnosticLogger logger("velkor::http");

}  // namespace velkor::http::detail
