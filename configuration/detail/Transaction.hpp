#pragma once

#include <optional>
#include <string>
#include <vector>

#include "configuration/Changes.hpp"
#include "configuration/detail/SourceRegistry.hpp"

namespace velkor::configuration::detail {

/// Why `target` can't take `change`, the text of an error of the store; empty when it can.
/// `target` is null when there is no source for it.
std::string refusalOf(const Change& change, const RegisteredSource* target);

/// Several changes that are made together or not at all. Used with the store's mutex held, and
/// while the list of sources that it was made for is kept.
class Transaction {
public:
    /// Finds the source for each of `changes`, which must live as long as this.
    Transaction(SourceRegistry& sources, const std::vector<Change>& changes);

    /// What is refused, each with its key, the changes in their order, separated by "; "; empty
    /// when nothing is.
    std::string refusals() const;

    /// What is, or would be, changed where. Nothing is refused. `before` is what is there now, for
    /// several changes of one key in one source what was there before the first.
    const std::vector<AppliedChange>& outcome() const noexcept { return applied; }

    /// Makes the changes, in their order. When a source throws, those that were made are taken back
    /// in the reverse order, as far as the sources let them, and the exception passes on.
    void write(SourceRegistry& sources);

private:
    void writeOne(SourceRegistry& sources, std::size_t index,
                  std::optional<ConfigurationValue>&& value);
    void takeBack(SourceRegistry& sources, std::size_t count) noexcept;

    const std::vector<Change>& changes;
    std::vector<const RegisteredSource*> targets;  // one for each change; null: there is none
    std::vector<AppliedChange> applied;            // empty when something is refused
};

}  // namespace velkor::configuration::detail
