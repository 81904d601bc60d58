#include "framework/json/JsonSerializer.hpp"

namespace velkor::json {

JsonSerializer::~JsonSerializer() = default;

}  // namespace velkor::json
