#include <algorithm>
#include <boost/locale/encoding_utf.hpp>
#include <cmath>
#include <functional>

#include "host/TerminalText.hpp"
#include "host/console/OptionWords.hpp"
#include "host/look/FileFormat.hpp"
#include "host/look/JsonLines.hpp"
#include "host/look/KeyPattern.hpp"
#include "host/look/LookCommands.hpp"
#include "host/look/PlainText.hpp"
#include "host/look/PropertyLine.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using configuration::ConfigurationValue;

/// Whether all of it is a text in the encoding of its kind of character.
template <class Char>
bool isWellFormed(const std::basic_string<Char>& text) {
    using Traits = boost::locale::utf::utf_traits<Char>;
    for (auto at = text.begin(); at != text.end();) {
        if (!boost::locale::utf::is_valid_codepoint(Traits::decode(at, text.end()))) return false;
    }
    return true;
}

/// Whether JSON holds a value exactly.
struct FitsJson : boost::static_visitor<bool> {
    template <class Whole>
    bool operator()(Whole) const {
        return true;
    }
    bool operator()(double number) const { return std::isfinite(number); }
    bool operator()(const std::string& text) const { return isWellFormed(text); }
    bool operator()(const std::u16string& text) const { return isWellFormed(text); }

    template <class Element>
    bool operator()(const std::vector<Element>& elements) const {
        return std::all_of(elements.begin(), elements.end(),
                           [this](const auto& element) { return (*this)(element); });
    }
};

using WriteOption = std::function<void(const std::string& key, const ConfigurationValue& value)>;

/// Writes every option that is no secret, and notes which are.
void exportThem(const std::shared_ptr<SessionStore>& store, KeySelection& selection,
                CommandOutput& output, const WriteOption& write) {
    const auto secrets = settings::secretKeys(store);
    std::string leftOut;
    selection.forEach([&](const std::string& key) {
        if (secrets.count(key) != 0) {
            leftOut += (leftOut.empty() ? "" : ", ") + key;
        } else if (const auto option = store->read({key}).get().options.front()) {
            write(key, option->value);
        }
    });
    if (!leftOut.empty()) output.note("Left out since they are secret: " + leftOut);
}

void exportJson(const std::shared_ptr<SessionStore>& store, KeySelection& selection,
                CommandOutput& output) {
    JsonLines lines(output);
    exportThem(store, selection, output, [&](const auto& key, const auto& value) {
        if (!isWellFormed(key) || !boost::apply_visitor(FitsJson(), value)) {
            throw CommandError("JSON can't hold " + key + ": it is no UTF-8, or no finite number");
        }
        lines.add(key, valueJson(value, false));
    });
    lines.end();
}

void exportProperties(const std::shared_ptr<SessionStore>& store, KeySelection& selection,
                      CommandOutput& output) {
    std::size_t othersThanText = 0;
    exportThem(store, selection, output, [&](const auto& key, const auto& value) {
        if (boost::get<std::string>(&value) == nullptr) ++othersThanText;
        output.line(propertyLine(key, plainText(value)));
    });
    if (othersThanText == 0) return;
    output.note(std::to_string(othersThanText) +
                (othersThanText == 1 ? " value becomes" : " values become") +
                " text in a property file; --format json keeps every type.");
}

}  // namespace

void exportOptions(const std::shared_ptr<SessionStore>& store,
                   const std::vector<std::string>& arguments, CommandOutput& output) {
    const OptionWords given("export", exportUsage, 0, arguments);
    const auto format = chosenFormat(given).value_or(FileFormat::properties);
    KeySelection selection(given.texts(), *store);
    if (format == FileFormat::json) {
        exportJson(store, selection, output);
    } else {
        exportProperties(store, selection, output);
    }
    selection.requireAllFound();
}

}  // namespace velkor::host
