#pragma once

#include <string>

#include "http/detail/routes/PendingAnswer.hpp"
#include "http/detail/routes/Route.hpp"

namespace velkor::http::detail {

/// Keeps in the log, as a warning, who wrote which keys from where, and how that was answered; no
/// values: "write: PATCH /config by token 2 from 127.0.0.1:50312: a, b -> 200".
class WriteRecord {
public:
    /// Of what the sender of `call` does at its route.
    explicit WriteRecord(const Call& call);

    /// Names a key that is written. Of many the first ones are named, and the number of the others.
    /// Escaped as in a path: one record is one line.
    void add(const std::string& key);

    /// Writes the record and gives `response`.
    void answer(PendingAnswer& pending, Response&& response) const;

private:
    std::string begin;
    std::string keys;
    std::size_t unnamed = 0;
};

}  // namespace velkor::http::detail
