#include "http/detail/Service.hpp"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <exception>
#include <memory>
#include <new>
#include <optional>
#include <stdexcept>
#include <string_view>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "http/Refused.hpp"
#include "http/detail/ClientStore.hpp"
#include "http/detail/PropertyRoot.hpp"
#include "http/detail/routes/Jobs.hpp"
#include "http/detail/routes/Problem.hpp"
#include "http/detail/routes/Route.hpp"
#include "http/detail/routes/Worker.hpp"
#include "http/detail/routes/WriteRecord.hpp"

namespace velkor::http::detail {

namespace {

using configuration::ConfigurationImpl;

constexpr std::size_t mostWaiting = 64;
constexpr std::size_t smallBody = 4096;

std::shared_ptr<const PropertyRoot> propertyRootOf(const ServerOptions& options) {
    if (options.propertyRoot.empty()) return nullptr;
    return std::make_shared<PropertyRoot>(options.propertyRoot, options.maxPropertyFileBytes);
}

messages::JsonLimits limitsOf(const ServerOptions& options) {
    return {options.maxBodyBytes, options.maxJsonDepth, options.maxJsonContainers};
}

std::shared_ptr<Metrics> metricsOfRoutes() {
    std::vector<std::string> names;
    for (const Route& route : routes()) {
        names.push_back(std::string(route.method).append(" ").append(route.path));
    }
    return std::make_shared<Metrics>(names);
}

/// The path and the query of what a request asks for.
struct Target {
    std::string_view path;
    std::string_view query;
};

Target targetOf(std::string_view sent) {
    if (sent.empty() || sent.front() != '/') {
        throw Problem(ProblemKind::badRequest, "The target of the request is no path.");
    }
    const auto end = std::min(sent.find('?'), sent.size());
    return {sent.substr(0, end), sent.substr(std::min(end + 1, sent.size()))};
}

std::string_view methodOf(const Request& request) {
    return request.method == "HEAD" ? std::string_view("GET") : request.method;
}

// The methods that there are at `path`; empty if it is none.
std::string allowedAt(std::string_view path) {
    std::string methods;
    for (const Route& route : routes()) {
        if (!route.isAt(path) || methods.find(route.method) != std::string::npos) continue;
        if (!methods.empty()) methods += ", ";
        methods += route.method;
        if (route.method == "GET") methods += ", HEAD";
    }
    return methods;
}

const Route* routeAt(std::string_view path, std::string_view method) {
    const auto& all = routes();
    const auto found = std::find_if(all.begin(), all.end(), [&](const Route& route) {
        return route.method == method && route.isAt(path);
    });
    return found == all.end() ? nullptr : &*found;
}

// There is no route of that method at `path`.
Response otherMethod(std::string_view path, const std::string& method) {
    std::string allowed = allowedAt(path);
    if (allowed.empty()) {
        throw Problem(ProblemKind::notFound, "There is nothing at " + std::string(path));
    }
    Response response = method == "OPTIONS" ? Response{204, {}, {}, {}}
                                            : problemResponse(ProblemKind::methodNotAllowed,
                                                              "Allowed here: " + allowed);
    response.headers.emplace_back("Allow", std::move(allowed));
    return response;
}

void requireKnown(const Route& route, const Parameters& parameters) {
    for (auto each = parameters.begin(); each != parameters.end(); ++each) {
        const auto& name = each->first;
        if (name.empty() || std::find(route.parameters.begin(), route.parameters.end(), name) ==
                                route.parameters.end()) {
            throw Problem(ProblemKind::badRequest, "Unknown query parameter: " + name);
        }
        if (std::any_of(parameters.begin(), each,
                        [&](const auto& before) { return before.first == name; })) {
            throw Problem(ProblemKind::badRequest, "Query parameter given twice: " + name);
        }
    }
}

std::string argumentOf(const Route& route, std::string_view path) {
    if (!route.hasArgument()) return {};
    auto argument = percentDecoded(path.substr(route.path.size()));
    if (!argument) {
        throw Problem(ProblemKind::badRequest, "The path is not percent-encoded right.");
    }
    return *std::move(argument);
}

// The address without the port.
std::string machineOf(const Client& client) {
    return client.address.substr(0, client.address.rfind(':'));
}

/// Keeps the records of those who have no right at all from filling the log: one a second.
class Strangers {
public:
    bool mayBeNoted() noexcept {
        using std::chrono::steady_clock;
        const auto now = std::chrono::duration_cast<std::chrono::seconds>(
            steady_clock::now().time_since_epoch());
        return last.exchange(now.count()) != now.count();
    }

private:
    std::atomic<std::int64_t> last{0};
};

/// Leads requests through access and routing to what answers them. Safe for concurrent use: what
/// is no constant here (keys, changes, counts, strangers, jobs) is so by itself.
class Service final : public Handler {
public:
    Service(std::shared_ptr<ConfigurationImpl> store, const ServerOptions& serverOptions,
            std::shared_ptr<const TransportCounts> counts, std::unique_ptr<Jobs> whoWorks)
        : options(serverOptions),
          access(options),
          messageService(std::make_shared<ClientStore>(store, propertyRootOf(options)),
                         limitsOf(options), secretsOf(store)),
          context{store,
                  options,
                  access,
                  keys,
                  std::make_shared<ChangeHub>(),
                  metricsOfRoutes(),
                  std::move(counts),
                  messageService.dispatcherFor(messages::allRequestTypes()),
                  limitsOf(options)},
          jobs(std::move(whoWorks)) {}

    void handle(Request&& request, std::function<void(Answer&&)> answer) override {
        Call call{std::move(request),
                  PendingAnswer(std::move(answer), context.metrics, routes().size())};
        answering(call, [&] { letIn(call); });
    }

    std::optional<Response> objection(const Request& head) override {
        std::optional<Response> found;
        Call call{head, PendingAnswer([&](Answer&& given) { found = std::get<Response>(given); },
                                      context.metrics, routes().size())};
        answering(call, [&] { enter(call); });
        call.answer.withdraw();
        return found;
    }

    Response refusal(int status) const override {
        const ProblemKind kind = problemOf(status);
        return problemResponse(kind, textOf(kind));
    }

    void stop() noexcept override { jobs->stop(); }

private:
    // Runs `work`, and answers with what it throws. Without memory the answer is that of a request
    // that had no turn.
    template <class Work>
    void answering(Call& call, Work&& work) {
        try {
            work();
        } catch (const std::bad_alloc&) {
            return;
        } catch (...) {
            refuse(call, problemResponse(std::current_exception()));
        }
    }

    // Attempts to write leave a record as well.
    void refuse(Call& call, Response&& response) {
        const bool isWrite = call.route != nullptr && call.route->right == Right::write;
        const bool isKnown = call.visitor.right != Right::none;
        if (!isWrite || (!isKnown && !strangers.mayBeNoted())) {
            return call.answer(std::move(response));
        }
        WriteRecord(call).answer(call.answer, std::move(response));
    }

    // Finds out what is asked for, by whom, and whether they may; false when that was answered.
    bool enter(Call& call) {
        const Request& request = call.request;
        const std::string_view path = targetOf(request.target).path;
        call.route = routeAt(path, methodOf(request));
        access.requireOwnName(request);
        if (call.route == nullptr) {
            call.answer(otherMethod(path, request.method));
            return false;
        }
        call.answer.belongsTo(static_cast<std::size_t>(call.route - routes().data()));
        if (!call.route->isForAnyone) Access::requireOwnSite(request);
        call.visitor = access.visitorOf(request);
        access.requireRight(call.visitor, call.route->right);
        return true;
    }

    void letIn(Call& call) {
        if (!enter(call)) return;
        const Request& request = call.request;
        const Target target = targetOf(request.target);
        const Route& route = *call.route;
        if (!route.isForAnyone && !target.query.empty()) {
            call.parameters = parsedQuery(target.query);
            requireKnown(route, call.parameters);
        }
        call.argument = argumentOf(route, target.path);
        const bool isLight = route.place == Place::caller && request.body.size() <= smallBody;
        if (isLight) return route.handle(context, call);
        enqueue(call);
    }

    void enqueue(Call& call) {
        const auto kept = std::make_shared<Call>(std::move(call));
        const bool isWrite = kept->route->right == Right::write;
        jobs->post(
            isWrite ? Jobs::Kind::write : Jobs::Kind::read, machineOf(kept->request.client),
            [this, kept] { answering(*kept, [&] { kept->route->handle(context, *kept); }); });
    }

    static std::string_view textOf(ProblemKind kind) {
        switch (kind) {
            case ProblemKind::badRequest:
                return "The request is no HTTP that is understood here.";
            case ProblemKind::timeout:
                return "The request was not complete in time.";
            case ProblemKind::tooLarge:
                return "The body is too large.";
            case ProblemKind::headersTooLarge:
                return "The headers are too large.";
            case ProblemKind::unavailable:
                return "There are too many connections or streams, or too much is kept for "
                       "clients.";
            default:
                return "The request can't be answered.";
        }
    }

    const ServerOptions options;
    const Access access;
    const messages::MessageService messageService;
    KeyList keys;
    Strangers strangers;
    const Context context;
    const std::unique_ptr<Jobs> jobs;  // the last member: they use the others
};

}  // namespace

std::shared_ptr<Handler> makeService(std::shared_ptr<ConfigurationImpl> store,
                                     const ServerOptions& options,
                                     std::shared_ptr<const TransportCounts> counts) {
    return makeService(std::move(store), options, std::move(counts),
                       std::make_unique<Worker>(mostWaiting));
}

std::shared_ptr<Handler> makeService(std::shared_ptr<ConfigurationImpl> store,
                                     const ServerOptions& options,
                                     std::shared_ptr<const TransportCounts> counts,
                                     std::unique_ptr<Jobs> jobs) {
    return std::make_shared<Service>(std::move(store), options, std::move(counts), std::move(jobs));
}

}  // namespace velkor::http::detail
