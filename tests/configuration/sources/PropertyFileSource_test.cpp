#include "configuration/sources/PropertyFileSource.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <clocale>
#include <cwchar>
#include <filesystem>
#include <locale>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/configuration/sources/PropertyReading.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/ScopedGlobalLocale.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using testing::Properties;
using ::testing::StrEq;
using testing::TemporaryFile;
using testing::textOf;
using ::testing::ThrowsMessage;

static_assert(!std::is_copy_constructible_v<PropertyFileSource>);
static_assert(!std::is_copy_assignable_v<PropertyFileSource>);
static_assert(
    std::is_base_of_v<std::enable_shared_from_this<PropertyFileSource>, PropertyFileSource>);

auto opening(const std::u16string& path) {
    return [path] { const PropertyFileSource source(path); };
}

auto failsToOpen(const std::string& path) {
    return ThrowsMessage<std::runtime_error>(StrEq("Property file could not be opened: " + path));
}

TEST(PropertyFileSourceOpening, MissingFileThrowsWithThePath) {
    EXPECT_THAT(opening(u"/missing/file.properties"), failsToOpen("/missing/file.properties"));
}

TEST(PropertyFileSourceOpening, MissingRelativeFileThrowsWithThePathAsGiven) {
    EXPECT_THAT(opening(u"./missing.properties"), failsToOpen("./missing.properties"));
}

TEST(PropertyFileSourceOpening, EmptyPathThrows) {
    EXPECT_THAT(opening(u""), failsToOpen(""));
}

TEST(PropertyFileSourceOpening, NonAsciiPathIsSpelledInUtf8) {
    EXPECT_THAT(opening(u"/missing/gr\u00F6\u00DFe-\u20AC-\U0001F600"),
                failsToOpen("/missing/gr\xC3\xB6\xC3\x9F"
                            "e-\xE2\x82\xAC-\xF0\x9F\x98\x80"));
}

TEST(PropertyFileSourceOpening, LoneSurrogateInThePathIsSpelledAsReplacement) {
    const std::u16string path{u'/', char16_t{0xD800}, u'x'};
    EXPECT_THAT(opening(path), failsToOpen("/\xEF\xBF\xBDx"));
}

TEST(PropertyFileSourceOpening, DirectoryThrows) {
    const TemporaryFile file("a=1\n");
    EXPECT_THAT(opening(file.parent().u16string()), failsToOpen(file.parent().string()));
}

TEST(PropertyFileSourceOpening, DirectoryWithATrailingSlashThrows) {
    const TemporaryFile file("a=1\n");
    EXPECT_THAT(opening(file.parent().u16string() + u"/"),
                failsToOpen(file.parent().string() + "/"));
}

TEST(PropertyFileSourceOpening, LinkToADirectoryThrows) {
    const TemporaryFile file("a=1\n");
    const auto link = file.parent() / "link";
    std::filesystem::create_directory_symlink(file.parent(), link);
    EXPECT_THAT(opening(link.u16string()), failsToOpen(link.string()));
}

TEST(PropertyFileSourceOpening, NulInThePathThrowsAlthoughThePartBeforeItExists) {
    const TemporaryFile file("a=1\n");
    EXPECT_THAT(opening(file.widePath() + u'\0'), failsToOpen(file.path().string()));
}

TEST(PropertyFileSourceOpening, LinkToAFileIsFollowed) {
    const TemporaryFile file("a=1\n");
    const auto link = file.parent() / "link";
    std::filesystem::create_symlink(file.path(), link);
    PropertyFileSource source(link.u16string());
    EXPECT_TRUE(source.has("a"));
}

TEST(PropertyFileSourceOpening, NonAsciiPathIsOpened) {
    const TemporaryFile file("a=1\n",
                             "gr\xC3\xB6\xC3\x9F"
                             "e-\xF0\x9F\x98\x80.properties");
    EXPECT_EQ(testing::readProperties(file), (Properties{{"a", "1"}}));
}

TEST(PropertyFileSourceOpening, FileThatCannotBeOpenedIsNotLogged) {
    const testing::LogCapture log("velkor::configuration::property_file");
    EXPECT_ANY_THROW(opening(u"/missing/file.properties")());
    EXPECT_THAT(log.messages(), IsEmpty());
}

class PropertyFileSourceTest : public ::testing::Test {
protected:
    TemporaryFile file{"b=2\na=1\n"};
    std::shared_ptr<PropertyFileSource> source =
        std::make_shared<PropertyFileSource>(file.widePath());
};

TEST_F(PropertyFileSourceTest, EveryValueIsNarrowText) {
    EXPECT_EQ(textOf(source->get("a")), "string 1");
}

TEST_F(PropertyFileSourceTest, GetOfAMissingKeyThrowsOutOfRange) {
    EXPECT_THAT([&] { source->get("c"); },
                ThrowsMessage<std::out_of_range>(StrEq("_Map_base::at")));
}

TEST_F(PropertyFileSourceTest, HasKnowsItsKeysOnly) {
    EXPECT_TRUE(source->has("a"));
    EXPECT_FALSE(source->has("c"));
    EXPECT_FALSE(source->has(""));
}

TEST_F(PropertyFileSourceTest, KeysAreSorted) {
    EXPECT_THAT(source->keys(), ElementsAre("a", "b"));
}

TEST_F(PropertyFileSourceTest, SetThrows) {
    EXPECT_THAT(
        [&] { source->set("a", 5); },
        ThrowsMessage<std::runtime_error>(StrEq("PropertyFileSource does not support writing")));
}

TEST_F(PropertyFileSourceTest, SetOfANewKeyThrows) {
    EXPECT_THAT(
        [&] { source->set("", std::string("x")); },
        ThrowsMessage<std::runtime_error>(StrEq("PropertyFileSource does not support writing")));
}

TEST_F(PropertyFileSourceTest, SetChangesNothing) {
    EXPECT_ANY_THROW(source->set("a", 5));
    EXPECT_ANY_THROW(source->set("c", 5));
    EXPECT_EQ(testing::propertiesOf(*source), (Properties{{"a", "1"}, {"b", "2"}}));
}

TEST_F(PropertyFileSourceTest, SetTellsNoListener) {
    bool told = false;
    source->setChangeListener([&](const std::string&) { told = true; });
    EXPECT_ANY_THROW(source->set("a", 5));
    EXPECT_FALSE(told);
}

TEST_F(PropertyFileSourceTest, ListenerIsKeptUntilItIsReplaced) {
    const auto token = std::make_shared<int>();
    source->setChangeListener([token](const std::string&) {});
    EXPECT_EQ(token.use_count(), 2);
    source->setChangeListener({});
    EXPECT_EQ(token.use_count(), 1);
}

TEST_F(PropertyFileSourceTest, DestructionDestroysTheListener) {
    const auto token = std::make_shared<int>();
    source->setChangeListener([token](const std::string&) {});
    source.reset();
    EXPECT_EQ(token.use_count(), 1);
}

TEST_F(PropertyFileSourceTest, LaterChangesOfTheFileAreNotSeen) {
    file.rewrite("a=9\nc=3\n");
    EXPECT_EQ(testing::propertiesOf(*source), (Properties{{"a", "1"}, {"b", "2"}}));
}

TEST_F(PropertyFileSourceTest, OutlivesTheFile) {
    std::filesystem::remove(file.path());
    EXPECT_EQ(textOf(source->get("b")), "string 2");
}

TEST_F(PropertyFileSourceTest, GivesOutSharedPointersToItself) {
    EXPECT_EQ(source->shared_from_this(), source);
}

TEST_F(PropertyFileSourceTest, ManyThreadsMayReadAtOnce) {
    testing::Latch start(4);
    std::atomic<int> wrong{0};
    std::vector<std::thread> readers;
    for (int reader = 0; reader < 4; ++reader) {
        readers.emplace_back([&, key = reader % 2 == 0 ? "a" : "b"] {
            const std::string expected = *key == 'a' ? "string 1" : "string 2";
            if (!start.arriveAndWait()) ++wrong;
            for (int round = 0; round < 2000; ++round) {
                if (!source->has(key) || textOf(source->get(key)) != expected) ++wrong;
                if (source->has("c") || source->keys().size() != 2) ++wrong;
            }
        });
    }
    for (auto& reader : readers) reader.join();
    EXPECT_EQ(wrong, 0);
}

TEST(PropertyFileContent, FileOfOnlyCommentsAndLineBreaksIsEmpty) {
    const TemporaryFile file("# a=1\n\n! b=2\n");
    PropertyFileSource source(file.widePath());
    EXPECT_THAT(source.keys(), IsEmpty());
    EXPECT_FALSE(source.has(""));
    EXPECT_FALSE(source.has("a"));
}

TEST(PropertyFileContent, CarriageReturnsGiveTheSameAsLineFeeds) {
    const std::string text = "# c\na=1\n\nb = x\\\n  y\nc=\n";
    std::string windows;
    for (const char byte : text)
        windows += byte == '\n' ? std::string("\r\n") : std::string(1, byte);
    EXPECT_EQ(testing::readProperties(TemporaryFile(windows)),
              testing::readProperties(TemporaryFile(text)));
}

TEST(PropertyFileContent, LongValueIsKeptWhole) {
    const std::string value(300000, 'v');
    EXPECT_EQ(testing::readProperties(TemporaryFile("a=" + value + "\nb=2\n")),
              (Properties{{"a", value}, {"b", "2"}}));
}

TEST(PropertyFileContent, ManyPropertiesAreAllKept) {
    std::string text;
    Properties expected;
    for (int number = 0; number < 20000; ++number) {
        const std::string digits = std::to_string(number);
        text += "key." + digits + " = value " + digits + "\n";
        expected["key." + digits] = "value " + digits;
    }
    EXPECT_EQ(testing::readProperties(TemporaryFile(text)), expected);
}

TEST(PropertyFileContent, EndlessEscapesDoNotExhaustTheStack) {
    std::string value;
    for (int number = 0; number < 200000; ++number) value += "\\x";
    EXPECT_EQ(testing::readProperties(TemporaryFile("a=" + value + "\n")),
              (Properties{{"a", std::string(200000, 'x')}}));
}

class PropertyFileLog : public ::testing::Test {
protected:
    static std::vector<std::string> messagesFor(const std::string& text,
                                                unsigned severities = common::trace) {
        const TemporaryFile file(text);
        const testing::LogCapture log("velkor::configuration::property_file", severities);
        const PropertyFileSource source(file.widePath());
        return log.messages();
    }
};

TEST_F(PropertyFileLog, EachPropertyInTheOrderOfTheFile) {
    EXPECT_THAT(messagesFor("b = 2\na=1\n"),
                ElementsAre("Parsed property: b = 2", "Parsed property: a = 1"));
}

TEST_F(PropertyFileLog, FinalPropertyHasATextOfItsOwn) {
    EXPECT_THAT(messagesFor("a=1\nk=v"),
                ElementsAre("Parsed property: a = 1", "Parsed final property: k = v"));
}

TEST_F(PropertyFileLog, EmptyKeyAndValueAreLoggedAsTheyAre) {
    EXPECT_THAT(messagesFor("=\n"), ElementsAre("Parsed property:  = "));
}

TEST_F(PropertyFileLog, RepeatedKeyIsLoggedEachTime) {
    EXPECT_THAT(messagesFor("a=1\na=2\n"),
                ElementsAre("Parsed property: a = 1", "Parsed property: a = 2"));
}

TEST_F(PropertyFileLog, DroppedTextIsNotLogged) {
    EXPECT_THAT(messagesFor("k"), IsEmpty());
    EXPECT_THAT(messagesFor("k="), IsEmpty());
    EXPECT_THAT(messagesFor("=v"), IsEmpty());
    EXPECT_THAT(messagesFor("k=v\\"), IsEmpty());
}

TEST_F(PropertyFileLog, RecordsHaveTheSeverityTrace) {
    const TemporaryFile file("a=1\nb=2");
    const testing::LogCapture log("velkor::configuration::property_file");
    const PropertyFileSource source(file.widePath());
    ASSERT_EQ(log.records().size(), 2U);
    for (const auto& record : log.records()) EXPECT_EQ(record.severity, 16U);
}

TEST_F(PropertyFileLog, NothingWithoutTheSeverity) {
    EXPECT_THAT(messagesFor("a=1\nb=2", testing::everySeverity & ~common::trace), IsEmpty());
}

TEST_F(PropertyFileLog, NothingByDefault) {
    EXPECT_EQ(testing::LogCapture::enabledSeverities("velkor::configuration::property_file") & 24U,
              0U);
}

// A conversion as some hosts install it: swaps upper and lower case on the way in.
class CaseSwappingConversion : public std::codecvt<char, char, std::mbstate_t> {
protected:
    bool do_always_noconv() const noexcept override { return false; }
    int do_encoding() const noexcept override { return 1; }
    result do_in(state_type&, const char* from, const char* fromEnd, const char*& fromNext,
                 char* to, char* toEnd, char*& toNext) const override {
        for (; from != fromEnd && to != toEnd; ++from, ++to) {
            const bool letter = (*from | 0x20) >= 'a' && (*from | 0x20) <= 'z';
            *to = letter ? static_cast<char>(*from ^ 0x20) : *from;
        }
        fromNext = from;
        toNext = to;
        return from == fromEnd ? ok : partial;
    }
};

// A classification in which nothing is what it seems.
class EverythingIsSpace : public std::ctype<char> {
public:
    EverythingIsSpace() : std::ctype<char>(table()) {}

private:
    static const mask* table() {
        static const std::vector<mask> masks(table_size, static_cast<mask>(space | cntrl));
        return masks.data();
    }
};

class PropertyFileLocale : public ::testing::Test {
protected:
    TemporaryFile file{"Key = Val\\u00e9\\ne,5.0\nlast=\\u-041\\u 041"};
    const Properties expected{{"Key", "Val\xC3\xA9ne,5.0"}, {"last", "A"}};
};

TEST_F(PropertyFileLocale, HostsCharacterConversionChangesNothing) {
    const testing::ScopedGlobalLocale host(
        std::locale(std::locale::classic(), new CaseSwappingConversion));
    EXPECT_EQ(testing::readProperties(file), expected);
}

TEST_F(PropertyFileLocale, HostsCharacterClassesChangeNothing) {
    const testing::ScopedGlobalLocale host(
        std::locale(std::locale::classic(), new EverythingIsSpace));
    EXPECT_EQ(testing::readProperties(file), expected);
}

TEST_F(PropertyFileLocale, HostsNumbersChangeNothing) {
    const testing::ScopedGlobalLocale host(
        std::locale(std::locale::classic(), new testing::CommaNumbers));
    EXPECT_EQ(testing::readProperties(file), expected);
}

TEST_F(PropertyFileLocale, HostsCLocaleChangesNothing) {
    ASSERT_NE(std::setlocale(LC_ALL, "C.utf8"), nullptr);
    const Properties properties = testing::readProperties(file);
    std::setlocale(LC_ALL, "C");
    EXPECT_EQ(properties, expected);
}

TEST(PropertyFileSourceText, IsParsedLikeAFile) {
    PropertyFileSource source(PropertyText{"a=\\u20ac\n# b=2\nc=3"});
    EXPECT_THAT(source.keys(), ElementsAre("a", "c"));
    EXPECT_EQ(textOf(source.get("a")), "string \u20ac");
}

TEST(PropertyFileSourceText, NeedNotLiveOn) {
    std::string text = "a=1\n";
    PropertyFileSource source{PropertyText{text}};
    text.assign(text.size(), 'x');
    EXPECT_EQ(textOf(source.get("a")), "string 1");
}

/// One that derives from it and answers differently.
class ShoutingSource : public PropertyFileSource {
public:
    using PropertyFileSource::PropertyFileSource;

    bool has(const std::string& key) override {
        return key == "loud" || PropertyFileSource::has(key);
    }

    ConfigurationValue get(const std::string& key) override {
        return PropertyFileSource::has(key) ? textOf(PropertyFileSource::get(key)) + "!"
                                            : std::string("!");
    }
};

class PropertyFileInAStore : public ::testing::Test {
protected:
    template <class Source>
    void add(const std::string& name, const std::string& group, int order, const char* text) {
        store->addSource(name, group, order, true, std::make_shared<Source>(PropertyText{text}));
    }

    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
};

TEST_F(PropertyFileInAStore, IsReadFromItsTable) {
    add<PropertyFileSource>("file", "app", 5, "a=1\n=2\n");
    EXPECT_EQ(textOf(store->get("app.a").get()), "string 1");
    EXPECT_EQ(textOf(store->get("app.").get()), "string 2");
    EXPECT_EQ(store->getOption("app.a").get().source, "file");
    EXPECT_FALSE(store->has("app.b").get());
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(PropertyFileInAStore, IsHiddenByAHigherFileAndShowsWhatThatHasNot) {
    add<PropertyFileSource>("low", "", 5, "a=1\nb=2\n");
    add<PropertyFileSource>("high", "", 4, "a=3\n");
    EXPECT_EQ(textOf(store->get("a").get()), "string 3");
    EXPECT_EQ(textOf(store->get("b").get()), "string 2");
    const auto all = store->explain("a").get();
    ASSERT_EQ(all.size(), 2U);
    EXPECT_EQ(textOf(all[1].value), "string 1");
}

TEST_F(PropertyFileInAStore, DerivedClassIsAsked) {
    add<ShoutingSource>("file", "", 5, "a=1\n");
    EXPECT_EQ(textOf(store->get("a").get()), "string string 1!");
    EXPECT_EQ(textOf(store->get("loud").get()), "string !");
}

TEST_F(PropertyFileInAStore, MayBeRemovedByTheRecordOfARead) {
    add<PropertyFileSource>("file", "", 5, "a=1\n");
    testing::LogCapture log("velkor::configuration", common::debug);
    bool removed = false;
    log.whenRecorded([&](const testing::LogRecord&) {
        if (std::exchange(removed, true)) return;
        store->removeSource("file");
    });
    EXPECT_EQ(textOf(store->get("a").get()), "string 1");
    EXPECT_FALSE(store->has("a").get());
}

}  // namespace
}  // namespace velkor::configuration
