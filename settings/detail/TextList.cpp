#include "settings/detail/TextList.hpp"

#include <algorithm>

#include "settings/detail/Text.hpp"

namespace velkor::settings::detail {

namespace {

// Reads one element after the other; `rest` is what is still to be read.
class ListReader {
public:
    explicit ListReader(std::string_view text) : rest(text) {}

    bool atEnd() const { return rest.empty(); }

    /// The next element. Afterwards `rest` is empty or begins with the comma behind it.
    Converted<std::string> element() {
        rest = trimmed(rest);
        if (!rest.empty() && rest.front() == '"') return quoted();
        return plain();
    }

    void skipComma() { rest.remove_prefix(1); }

private:
    Converted<std::string> plain() {
        const std::string_view text = trimmed(rest.substr(0, rest.find(',')));
        if (text.empty()) return Reason{"empty; an empty text is written \"\""};
        rest.remove_prefix(std::min(rest.find(','), rest.size()));
        return std::string(text);
    }

    Converted<std::string> quoted() {
        std::string text;
        rest.remove_prefix(1);
        while (!rest.empty() && rest.front() != '"') {
            if (rest.front() == '\\') {
                rest.remove_prefix(1);
                if (rest.empty() || (rest.front() != '"' && rest.front() != '\\')) {
                    return Reason{"a backslash in quotation marks before neither of \" and \\"};
                }
            }
            text += rest.front();
            rest.remove_prefix(1);
        }
        if (rest.empty()) return Reason{"its quotation mark is not closed"};
        rest = trimmed(rest.substr(1));
        const bool endsHere = rest.empty() || rest.front() == ',';
        if (!endsHere) return Reason{"something behind its closing quotation mark"};
        return text;
    }

    std::string_view rest;
};

bool needsQuotes(const std::string& element) {
    return element.empty() || element.front() == '"' || element.find(',') != std::string::npos ||
           trimmed(element).size() != element.size();
}

void appendQuoted(std::string& list, const std::string& element) {
    list += '"';
    for (const char character : element) {
        if (character == '"' || character == '\\') list += '\\';
        list += character;
    }
    list += '"';
}

}  // namespace

Converted<std::vector<std::string>> splitList(std::string_view text) {
    std::vector<std::string> elements;
    if (trimmed(text).empty()) return elements;
    ListReader reader(text);
    while (true) {
        Converted<std::string> element = reader.element();
        if (!element) return ofElement(elements.size(), element.reason());
        elements.push_back(std::move(element).value());
        if (reader.atEnd()) return elements;
        reader.skipComma();
    }
}

std::string joinList(const std::vector<std::string>& elements) {
    std::string list;
    for (const std::string& element : elements) {
        if (!list.empty()) list += ", ";
        if (needsQuotes(element)) {
            appendQuoted(list, element);
        } else {
            list += element;
        }
    }
    return list;
}

Reason ofElement(std::size_t index, const Reason& reason) {
    return Reason{"element " + std::to_string(index + 1) + ": " + reason.text};
}

}  // namespace velkor::settings::detail
