#include "framework/reactive_streams/Publisher.hpp"

namespace velkor::reactive_streams {

Publisher::~Publisher() = default;

}  // namespace velkor::reactive_streams
