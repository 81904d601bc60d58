#pragma once

#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>
#include <string_view>

namespace velkor::layers::etcd {

/// A text that is not the JSON that is expected.
class BadJson : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Reads one JSON text from front to back, strictly; what is asked for next has to come next. The
/// answers of a server can be long: nothing is kept of what has been read. Every function throws
/// `BadJson` when something else comes.
class JsonReader {
public:
    /// `text` must live as long as this and what its functions give.
    explicit JsonReader(std::string_view text) : rest(text) {}

    /// Calls `onMember` with the name of each member; it reads the value. The name is valid until
    /// then.
    template <class F>
    void object(F onMember) {
        const Level level(*this);
        expect('{');
        if (take('}')) return;
        do {
            const std::string name = text();
            expect(':');
            onMember(std::string_view(name));
        } while (take(','));
        expect('}');
    }

    /// Calls `onElement` for each element, which it reads.
    template <class F>
    void array(F onElement) {
        const Level level(*this);
        expect('[');
        if (take(']')) return;
        do {
            onElement();
        } while (take(','));
        expect(']');
    }

    /// A string as UTF-8. A surrogate that stands alone becomes U+FFFD.
    std::string text();

    /// A string without escapes, as it stands there.
    std::string_view plainText();

    /// A number as it stands there.
    std::string_view number();

    /// A whole number of 64 bits, also one that stands in a string.
    std::int64_t integer();

    bool boolean();

    /// Whether null comes next; reads it then.
    bool null();

    /// Whether a string, or an object, comes next.
    bool isText() { return peek() == '"'; }
    bool isObject() { return peek() == '{'; }

    /// Reads whatever comes next.
    void skip();

    /// Nothing comes any more.
    void end();

private:
    static constexpr std::size_t deepest = 64;

    /// An object or array that is open.
    class Level {
    public:
        explicit Level(JsonReader& reader);
        ~Level() { --owner.depth; }
        Level(const Level&) = delete;
        Level& operator=(const Level&) = delete;

    private:
        JsonReader& owner;
    };

    char peek();
    bool take(char character);
    void expect(char character);
    bool takeWord(std::string_view word);
    void skipBlanks();
    void readEscape(std::string& target);
    std::uint32_t readUnit();

    std::string_view rest;
    std::size_t depth = 0;
};

}  // namespace velkor::layers::etcd
