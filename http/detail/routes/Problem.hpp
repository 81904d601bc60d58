#pragma once

#include <exception>
#include <stdexcept>
#include <string>

#include "http/detail/Exchange.hpp"
#include "messages/MessageDispatcher.hpp"

namespace velkor::http::detail {

/// Why a request is not answered with what it asks for.
enum class ProblemKind {
    badRequest,
    unauthorised,
    forbidden,
    notFound,
    methodNotAllowed,
    timeout,
    notWritable,
    duplicateSource,
    tooLarge,
    fileNotOpened,
    headersTooLarge,
    internal,
    unavailable,
};

/// The reason why a request can't be answered, with a text for people to read. It repeats no
/// value: who shows it doesn't know what is secret.
class Problem : public std::runtime_error {
public:
    Problem(ProblemKind problemKind, const std::string& text)
        : std::runtime_error(text), kind(problemKind) {}

    ProblemKind kind;
};

/// The answer: an object of "type", "title", "status" and `detail`, of which at most 300
/// bytes are shown, as application/problem+json,
/// with the headers that belong to its status.
Response problemResponse(ProblemKind kind, std::string_view detail);

/// The kind of problem that has the HTTP status `status`; internal if there is none.
ProblemKind problemOf(int status);

/// The kind of problem that `failure` is.
ProblemKind problemOf(messages::DispatchFailure failure);

/// The answer to what `error` says: a `Problem`, a refusal of the store, or anything else that
/// failed, each with its own text. Lack of memory is thrown on as `std::bad_alloc`.
Response problemResponse(const std::exception_ptr& error);

}  // namespace velkor::http::detail
