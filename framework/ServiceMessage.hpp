#pragma once

#include <memory>
#include <typeinfo>
#include <utility>

#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/RoutingErrors.hpp"
#include "framework/common/Export.hpp"
#include "framework/detail/Routing.hpp"

namespace velkor {

/// A message addressed to services of type `P`.
template <class P>
class VELKOR_EXPORT ServiceMessage : public Message {
public:
    /// Hands this message, owned by `self`, to the operation of `provider` that answers it.
    virtual Future<std::unique_ptr<Message>> dispatch(std::shared_ptr<P> provider,
                                                      std::unique_ptr<Message>&& self,
                                                      Address&& from,
                                                      std::shared_ptr<Context>&& context) = 0;
};

/// Base of the request class `M`, which `P` answers in
/// `handle(std::unique_ptr<M>&&, Address&&, std::shared_ptr<Context>&&)`.
template <class M, class P>
class VELKOR_EXPORT MessageAPI : public ServiceMessage<P> {
public:
    /// Calls `provider->handle` with the ownership of this message, on the calling thread, and
    /// gives what it gives; what it throws passes on. When `handle` leaves the message alone, it is
    /// destroyed on return.
    ///
    /// `self` must own this very object, not merely one of its class. If it owns another, it keeps
    /// it, and the future fails with `std::invalid_argument` "Unable to deliver to service.
    /// Incorrect message type. Expected: ", the type name of `M`, " but found " and that of the
    /// other. A null `self` throws `std::bad_typeid`.
    Future<std::unique_ptr<Message>> dispatch(std::shared_ptr<P> provider,
                                              std::unique_ptr<Message>&& self, Address&& from,
                                              std::shared_ptr<Context>&& context) override;
};

// Not inline, so that a header which says `extern template` needs no more of `P` than its name.
template <class M, class P>
Future<std::unique_ptr<Message>> MessageAPI<M, P>::dispatch(std::shared_ptr<P> provider,
                                                            std::unique_ptr<Message>&& self,
                                                            Address&& from,
                                                            std::shared_ptr<Context>&& context) {
    if (self.get() != this) {
        return detail::failMismatch(routing_errors::notForThisObject, typeid(M),
                                    detail::typeOf(self.get()));
    }
    std::unique_ptr<M> request(static_cast<M*>(self.release()));
    return provider->handle(std::move(request), std::move(from), std::move(context));
}

}  // namespace velkor
