#include "http/detail/Loggers.hpp"

#include "layers/detail/Endings.hpp"

namespace velkor::http::detail {

const common::DiagnosticLogger logger("velkor::http");

namespace {

// Made after the logger, so that it is destroyed before it: the threads that are waited for still
// write records.
[[maybe_unused]] const auto& endings = layers::detail::Endings::ofLibrary();

}  // namespace

}  // namespace velkor::http::detail
