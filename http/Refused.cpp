#include "http/Refused.hpp"

namespace velkor::http {

Refused::Refused(const std::string& text) : std::runtime_error(text) {}
Refused::~Refused() = default;

}  // namespace velkor::http
