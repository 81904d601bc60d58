#pragma once

#include <string>
#include <utility>

namespace velkor::configuration::detail {

/// Notes whether a source reports a change of one key while this lives: one that has no listener of
/// the store may have one of an earlier registration. Used with the store's mutex held; several
/// form a chain, the innermost first.
class AwaitedReport {
public:
    /// Joins the chain that begins at `innermost`. `awaitedKey`, a full key, must live as long.
    AwaitedReport(AwaitedReport*& innermost, const std::string& awaitedKey)
        : chain(innermost), outer(std::exchange(innermost, this)), key(awaitedKey) {}
    ~AwaitedReport() { chain = outer; }

    AwaitedReport(const AwaitedReport&) = delete;
    AwaitedReport& operator=(const AwaitedReport&) = delete;

    /// Tells the chain that begins at `innermost` of a change of `changed`.
    static void note(AwaitedReport* innermost, const std::string& changed) {
        for (auto* each = innermost; each != nullptr; each = each->outer) {
            if (each->key == changed) each->come = true;
        }
    }

    bool hasCome() const noexcept { return come; }

private:
    AwaitedReport*& chain;
    AwaitedReport* const outer;
    const std::string& key;
    bool come = false;
};

}  // namespace velkor::configuration::detail
