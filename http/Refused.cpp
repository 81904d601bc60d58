#include "http/Refused.hpp"

namespace velkor::http {

Refused::Refused(const std::string& text, Cause refusedFor)
    : std::runtime_error(text), reason(refusedFor) {}
Refused::~Refused() = default;

}  // namespace velkor::http
