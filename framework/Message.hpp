#pragma once

#include <string>

#include "framework/common/Export.hpp"

namespace velkor {

/// What services exchange. A plain `Message` has no content: it acknowledges. Messages are movable
/// values, owned through `std::unique_ptr<Message>` and told apart by their run-time type.
class VELKOR_EXPORT Message {
public:
    Message() = default;
    Message(const Message&) = default;
    Message& operator=(const Message&) = default;
    virtual ~Message();
};

/// Where a message came from. Passed along with it and never looked into by a service.
struct Address {
    std::string value;
};

/// What else a host wants to pass along with a message; never looked into by a service.
class VELKOR_EXPORT Context {
public:
    virtual ~Context();
};

}  // namespace velkor
