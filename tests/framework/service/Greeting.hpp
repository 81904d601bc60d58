#pragma once

#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/ServiceMessage.hpp"
#include "framework/ServiceProvider.hpp"

namespace velkor::testing {

class GreetingService;

/// A request with an answer, for tests of what all services share.
struct Greet : MessageAPI<Greet, GreetingService> {
    explicit Greet(std::string toGreet = "") : name(std::move(toGreet)) {}
    ~Greet() override {
        if (destroyed != nullptr) *destroyed = true;
    }

    std::string name;
    bool* destroyed = nullptr;  ///< Set when the request is destroyed.
};

/// The answer to `Greet`.
struct Greeting : Message {
    explicit Greeting(std::string greeting) : text(std::move(greeting)) {}

    std::string text;
};

/// A request to another service.
class OtherService;
struct Ignored : ServiceMessage<OtherService> {
    Future<std::unique_ptr<Message>> dispatch(std::shared_ptr<OtherService>,
                                              std::unique_ptr<Message>&&, Address&&,
                                              std::shared_ptr<Context>&&) override {
        throw std::logic_error("delivered to the wrong service");
    }
};

class GreetingService : public ServiceProviderAPI<GreetingService> {
public:
    /// Greets; throws when there is no name. Takes the request only if `takes` is set.
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<Greet>&& request, Address&& from,
                                            std::shared_ptr<Context>&& given) {
        ++handled;
        sender = from.value;
        context = given;
        if (request->name.empty()) throw std::out_of_range("nobody to greet");
        auto reply = std::make_unique<Greeting>("Hello " + request->name);
        if (takes) taken = std::move(request);
        return makeReadyFuture<std::unique_ptr<Message>>(std::move(reply));
    }

    bool takes = false;
    int handled = 0;
    std::unique_ptr<Greet> taken;
    std::string sender;
    std::shared_ptr<Context> context;
};

/// The text of the greeting that `reply` holds.
inline std::string greetingIn(Future<std::unique_ptr<Message>> reply) {
    const std::unique_ptr<Message> message = reply.get();
    return dynamic_cast<const Greeting&>(*message).text;
}

/// The text of the error of type `Error` that `reply` fails with.
template <class Error>
std::string errorIn(Future<std::unique_ptr<Message>> reply) {
    try {
        reply.get();
    } catch (const Error& error) {
        return error.what();
    }
    return "no error";
}

}  // namespace velkor::testing
