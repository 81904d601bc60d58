#pragma once

#include <atomic>
#include <memory>
#include <typeinfo>
#include <utility>

#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/RoutingErrors.hpp"
#include "framework/ServiceMessage.hpp"
#include "framework/common/Export.hpp"
#include "framework/detail/Routing.hpp"

namespace velkor {

/// Whether something runs. It doesn't at first; its host switches it, on any thread.
class VELKOR_EXPORT Lifecycle {
public:
    virtual ~Lifecycle();

    bool isRunning() const noexcept { return running; }
    void setRunning(bool nowRunning) noexcept { running = nowRunning; }

private:
    std::atomic<bool> running{false};
};

/// A service that answers messages. Owned by a `std::shared_ptr`.
class VELKOR_EXPORT ServiceProvider : public Lifecycle,
                                      public std::enable_shared_from_this<ServiceProvider> {
public:
    ~ServiceProvider() override;

    /// For a host that wants to tell the service when it starts and stops running. This library
    /// calls neither; whether the service runs is said by `setRunning` alone.
    virtual void onStart() = 0;
    virtual void onStop() = 0;

    /// Answers `message`, which came from `from`. See `ServiceProviderAPI::deliver`.
    virtual Future<std::unique_ptr<Message>> deliver(std::unique_ptr<Message>&& message,
                                                     Address&& from,
                                                     std::shared_ptr<Context>&& context) = 0;
};

/// Base of the service type `P`, which has a `handle` for each request of type `MessageAPI<M, P>`.
template <class P>
class VELKOR_EXPORT ServiceProviderAPI : public ServiceProvider {
public:
    void onStart() override {}
    void onStop() override {}

    /// Hands `message` to the `handle` that answers it, on the calling thread and under no lock,
    /// and gives the reply. Safe for concurrent use as far as the handlers are.
    ///
    /// A message that can't be routed stays with the caller, and the future fails: with
    /// `std::runtime_error` "Service exists but is not running.", or with `std::invalid_argument`
    /// "Incorrect message type. Expected: ", the type name of `ServiceMessage<P>`, " but found "
    /// and that of the message. What the handler throws passes on. Throws `std::bad_typeid` when a
    /// running service is given no message, `std::bad_weak_ptr` when no shared pointer owns this.
    Future<std::unique_ptr<Message>> deliver(std::unique_ptr<Message>&& message, Address&& from,
                                             std::shared_ptr<Context>&& context) override {
        if (!isRunning()) return detail::failNotRunning();
        const std::type_info& found = detail::typeOf(message.get());
        auto* const request = dynamic_cast<ServiceMessage<P>*>(message.get());
        if (request == nullptr) {
            return detail::failMismatch(routing_errors::notForThisService,
                                        typeid(ServiceMessage<P>), found);
        }
        return request->dispatch(std::static_pointer_cast<P>(shared_from_this()),
                                 std::move(message), std::move(from), std::move(context));
    }
};

}  // namespace velkor
