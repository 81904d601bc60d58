#include "http/detail/routes/Problem.hpp"

#include <algorithm>
#include <array>
#include <new>
#include <string_view>

#include "configuration/StoreErrors.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "messages/JsonText.hpp"

namespace velkor::http::detail {

namespace {

using configuration::Refusal;
using messages::DispatchFailure;

struct ProblemRow {
    ProblemKind kind;
    int status;
    std::string_view type;
    std::string_view title;
};

// In the order of the kinds. Of kinds with the same status the first one stands for it.
constexpr std::array rows{
    ProblemRow{ProblemKind::badRequest, 400, "/problems/bad-request", "Bad request"},
    ProblemRow{ProblemKind::unauthorised, 401, "/problems/unauthorised", "Unauthorised"},
    ProblemRow{ProblemKind::forbidden, 403, "/problems/forbidden", "Forbidden"},
    ProblemRow{ProblemKind::notFound, 404, "/problems/not-found", "Not found"},
    ProblemRow{ProblemKind::methodNotAllowed, 405, "/problems/method-not-allowed",
               "Method not allowed"},
    ProblemRow{ProblemKind::timeout, 408, "/problems/timeout", "Request timeout"},
    ProblemRow{ProblemKind::notWritable, 409, "/problems/not-writable", "Not writable"},
    ProblemRow{ProblemKind::duplicateSource, 409, "/problems/duplicate-source",
               "Source exists already"},
    ProblemRow{ProblemKind::tooLarge, 413, "/problems/too-large", "Content too large"},
    ProblemRow{ProblemKind::fileNotOpened, 422, "/problems/file-not-opened", "File not opened"},
    ProblemRow{ProblemKind::headersTooLarge, 431, "/problems/headers-too-large",
               "Header fields too large"},
    ProblemRow{ProblemKind::internal, 500, "/problems/internal", "Internal error"},
    ProblemRow{ProblemKind::unavailable, 503, "/problems/unavailable", "Service unavailable"},
};

const ProblemRow& rowOf(ProblemKind kind) {
    return rows[static_cast<std::size_t>(kind)];
}

ProblemKind kindOf(Refusal refusal) {
    switch (refusal) {
        case Refusal::missingOption:
            return ProblemKind::notFound;
        case Refusal::notWritable:
            return ProblemKind::notWritable;
        case Refusal::duplicateSource:
            return ProblemKind::duplicateSource;
        case Refusal::fileNotOpened:
            return ProblemKind::fileNotOpened;
        case Refusal::fileNotAllowed:
            return ProblemKind::forbidden;
        case Refusal::notRunning:
            return ProblemKind::unavailable;
        case Refusal::misrouted:
            return ProblemKind::badRequest;
        case Refusal::other:
            break;
    }
    return ProblemKind::internal;
}

// A text may repeat what the client sent, which can be long.
std::string abbreviated(std::string_view detail) {
    constexpr std::size_t mostBytes = 300;
    if (detail.size() <= mostBytes) return std::string(detail);
    std::size_t end = mostBytes;
    while (end > 0 && (static_cast<unsigned char>(detail[end]) & 0xC0U) == 0x80U) --end;
    return std::string(detail.substr(0, end)) + "...";
}

}  // namespace

Response problemResponse(ProblemKind kind, std::string_view detail) {
    const ProblemRow& row = rowOf(kind);
    JsonWriter json;
    json.beginObject().member("type", row.type).member("title", row.title);
    json.name("status").number(row.status).member("detail", abbreviated(detail)).endObject();
    Response response{row.status, "application/problem+json", json.take(), {}};
    if (kind == ProblemKind::unauthorised) {
        response.headers.emplace_back("WWW-Authenticate", "Bearer");
    } else if (kind == ProblemKind::unavailable) {
        response.headers.emplace_back("Retry-After", "1");
    }
    return response;
}

ProblemKind problemOf(int status) {
    const auto* const found = std::find_if(
        rows.begin(), rows.end(), [&](const ProblemRow& row) { return row.status == status; });
    return found == rows.end() ? ProblemKind::internal : found->kind;
}

ProblemKind problemOf(DispatchFailure failure) {
    switch (failure) {
        case DispatchFailure::unknownType:
        case DispatchFailure::missingOption:
            return ProblemKind::notFound;
        case DispatchFailure::forbiddenType:
        case DispatchFailure::fileNotAllowed:
            return ProblemKind::forbidden;
        case DispatchFailure::noJsonObject:
        case DispatchFailure::misrouted:
            return ProblemKind::badRequest;
        case DispatchFailure::notRunning:
            return ProblemKind::unavailable;
        case DispatchFailure::notWritable:
            return ProblemKind::notWritable;
        case DispatchFailure::duplicateSource:
            return ProblemKind::duplicateSource;
        case DispatchFailure::fileNotOpened:
            return ProblemKind::fileNotOpened;
        case DispatchFailure::other:
            break;
    }
    return ProblemKind::internal;
}

Response problemResponse(const std::exception_ptr& error) {
    try {
        std::rethrow_exception(error);
    } catch (const std::bad_alloc&) {
        throw;
    } catch (const Problem& problem) {
        return problemResponse(problem.kind, problem.what());
    } catch (const messages::NoJsonObject& noObject) {
        return problemResponse(ProblemKind::badRequest, noObject.what());
    } catch (const std::exception& failure) {
        return problemResponse(kindOf(configuration::refusalOf(failure)), failure.what());
    } catch (...) {
        return problemResponse(ProblemKind::internal, "Unknown error");
    }
}

}  // namespace velkor::http::detail
