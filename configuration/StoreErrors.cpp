#include "configuration/StoreErrors.hpp"

#include <algorithm>
#include <array>
#include <stdexcept>
#include <string_view>
#include <typeinfo>

#include "framework/RoutingErrors.hpp"

namespace velkor::configuration {

namespace {

struct Pattern {
    const std::type_info& type;
    std::string_view beginning;
    Refusal refusal;
};

template <class Error>
constexpr Pattern pattern(const char* beginning, Refusal refusal) {
    return {typeid(Error), beginning, refusal};
}

using std::invalid_argument;
using std::runtime_error;

constexpr std::array patterns{
    pattern<runtime_error>(store_errors::noSuchOption, Refusal::missingOption),
    pattern<runtime_error>(store_errors::noOptionValue, Refusal::missingOption),
    pattern<runtime_error>(store_errors::noOption, Refusal::missingOption),
    pattern<runtime_error>(store_errors::noWritableSource, Refusal::notWritable),
    pattern<runtime_error>(store_errors::sourceNotWritable, Refusal::notWritable),
    pattern<runtime_error>(store_errors::cannotForget, Refusal::notWritable),
    pattern<runtime_error>(store_errors::changesRefused, Refusal::notWritable),
    pattern<runtime_error>(store_errors::writingNotSupported, Refusal::notWritable),
    pattern<invalid_argument>(store_errors::duplicateSource, Refusal::duplicateSource),
    pattern<runtime_error>(store_errors::fileNotOpened, Refusal::fileNotOpened),
    pattern<runtime_error>(store_errors::fileNotAllowed, Refusal::fileNotAllowed),
    pattern<runtime_error>(routing_errors::notRunning, Refusal::notRunning),
    pattern<invalid_argument>(routing_errors::notForThisObject, Refusal::misrouted),
    pattern<invalid_argument>(routing_errors::notForThisService, Refusal::misrouted),
};

}  // namespace

Refusal refusalOf(const std::exception& error) noexcept {
    const std::string_view text = error.what();
    const auto* const found =
        std::find_if(patterns.begin(), patterns.end(), [&](const Pattern& each) {
            return typeid(error) == each.type &&
                   text.substr(0, each.beginning.size()) == each.beginning;
        });
    return found == patterns.end() ? Refusal::other : found->refusal;
}

}  // namespace velkor::configuration
