#include "configuration/admin/ValueFormat.hpp"

#include <ostream>
#include <string>
#include <vector>

#include "framework/common/TextConversion.hpp"

namespace velkor::configuration {

namespace {

class Formatter : public boost::static_visitor<void> {
public:
    explicit Formatter(std::ostream& output) : out(output) {}

    void operator()(bool value) const { out << (value ? "true" : "false"); }
    void operator()(int value) const { out << value; }
    void operator()(unsigned int value) const { out << value; }
    void operator()(double value) const { out << value; }
    void operator()(const std::string& text) const { out << '\'' << text << '\''; }
    void operator()(const std::u16string& text) const {
        (*this)(common::TextConversion("UTF-8").fromUtf16(text));
    }

    template <class T>
    void operator()(const std::vector<T>& values) const {
        const char* separator = "";
        out << '[';
        for (const T& value : values) {
            out << separator;
            (*this)(value);
            separator = ", ";
        }
        out << ']';
    }

private:
    std::ostream& out;
};

}  // namespace

void formatValue(std::ostream& out, const ConfigurationValue& value) {
    boost::apply_visitor(Formatter(out), value);
}

}  // namespace velkor::configuration
