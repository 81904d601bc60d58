#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::reactive_streams {

Subscription::~Subscription() = default;

}  // namespace velkor::reactive_streams
