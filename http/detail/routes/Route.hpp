#pragma once

#include <array>
#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "http/ServerOptions.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/access/Access.hpp"
#include "http/detail/access/Right.hpp"
#include "http/detail/routes/ChangeHub.hpp"
#include "http/detail/routes/KeyList.hpp"
#include "http/detail/routes/Metrics.hpp"
#include "http/detail/routes/PendingAnswer.hpp"
#include "http/detail/routes/Target.hpp"
#include "messages/MessageService.hpp"

namespace velkor::http::detail {

/// What all routes work with. Immutable, but for what is thread-safe by itself.
struct Context {
    std::shared_ptr<configuration::ConfigurationImpl> store;
    const ServerOptions& options;
    const Access& access;
    KeyList& keys;
    std::shared_ptr<ChangeHub> changes;
    std::shared_ptr<Metrics> metrics;
    std::shared_ptr<const TransportCounts> transport;
    std::shared_ptr<const messages::MessageDispatcher> dispatcher;
    messages::JsonLimits jsonLimits;
};

struct Route;

/// One request.
struct Call {
    Request request;
    PendingAnswer answer;
    Parameters parameters{};
    std::string argument{};  ///< What the path says behind that of the route, decoded.
    Visitor visitor{};
    const Route* route = nullptr;  ///< Null while it is not known, and where there is none.
};

/// Where a route is worked on.
enum class Place {
    caller,  ///< On the thread of the connection, if the body is small.
    worker,  ///< On the worker: it writes, reads a file, or looks at all keys.
};

/// What there is at a path. All of them are in `routes`.
struct Route {
    /// Gives the answer, at once or later, or throws what `problemResponse` knows.
    using Handling = void (*)(const Context&, Call&);

    std::string_view method;
    std::string_view path;  ///< That begins the paths that are meant, if it ends in "/".
    Right right;
    Place place;
    Handling handle;
    std::array<std::string_view, 3> parameters{};  ///< That a query may have.
    bool isForAnyone = false;  ///< Pages of other sites may lead here, with any query.

    /// Whether `requested` is a path of this route.
    bool isAt(std::string_view requested) const noexcept;
    /// Whether the path goes on behind that of the route.
    bool hasArgument() const noexcept { return path.size() > 1 && path.back() == '/'; }
};

/// All routes; of those at one path with one method the first one counts.
const std::vector<Route>& routes();

/// What `respond` gives, as a `Route::Handling`.
template <Response (*respond)(const Context&, const Call&)>
void responding(const Context& context, Call& call) {
    call.answer(respond(context, call));
}

/// `json` as an answer.
inline Response jsonResponse(std::string&& json) {
    return {200, "application/json", std::move(json), {}};
}

/// The value of the query parameter `name`. Throws `Problem` of the kind badRequest without one.
const std::string& required(const Call& call, std::string_view name);

}  // namespace velkor::http::detail
