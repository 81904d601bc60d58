#include <gtest/gtest.h>

#include <random>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include "tests/configuration/admin/CommandTesting.hpp"
#include "tests/support/Sanitizers.hpp"

namespace velkor::configuration {
namespace {

// Whatever an operator types: it is stored, shown again and listed.
class CommandInput : public testing::CommandTest {
protected:
    // One text of up to `longest` bytes out of `alphabet`, or of any bytes when that is empty.
    std::string random(std::size_t longest, std::string_view alphabet = "") {
        std::string text(engine() % (longest + 1), '\0');
        for (char& byte : text) {
            byte = alphabet.empty() ? static_cast<char>(engine() % 256)
                                    : alphabet[engine() % alphabet.size()];
        }
        return text;
    }

    // What `text` is stored and shown as has to follow from its beginning alone.
    void exercise(const std::string& key, const std::string& text) {
        EXPECT_EQ(run("set", {key, text}), "");
        const ConfigurationValue stored = store->get(key).get();
        const std::string answer = run("get", {key});
        if (stored.which() == 5) {
            EXPECT_EQ(boost::get<std::string>(stored), text);
            EXPECT_EQ(answer, "'" + text + "'");
        } else {
            EXPECT_EQ(stored.which() == 3, text.find('.') != std::string::npos) << text;
            EXPECT_EQ(answer.find('\''), std::string::npos);
        }
    }

    std::mt19937 engine{12345};  // NOLINT(cert-msc51-cpp): every run has the same inputs
};

TEST_F(CommandInput, RandomBytesAreStoredAndShown) {
    for (int round = 0; round < 5000; ++round) exercise(random(8), random(40));
    EXPECT_GT(run("list").size(), store->keys().get().size());
}

TEST_F(CommandInput, RandomNumberLikeTextsAreStoredAndShown) {
    for (int round = 0; round < 20000; ++round) {
        exercise("key", random(24, "0123456789..--++eExXpPaAfFinN \t,"));
    }
}

TEST_F(CommandInput, VeryLongTextsAreStoredAndShown) {
    for (const char digit : {'0', '9', '.', ' ', '-', 'x'}) {
        exercise("key", std::string(200000, digit));
        exercise("key", "1." + std::string(200000, digit));
    }
    exercise(std::string(200000, 'k'), "1");
}

TEST_F(CommandInput, AnyNumberOfArgumentsIsAnsweredOrOutOfRange) {
    for (int round = 0; round < 500; ++round) {
        Arguments arguments(engine() % 5);
        for (auto& argument : arguments) argument = random(10);
        for (const auto& [verb, least] :
             {std::pair<const char*, std::size_t>{"set", 2}, {"get", 1}, {"list", 0}}) {
            if (arguments.size() >= least) {
                EXPECT_NO_THROW(run(verb, arguments));
            } else {
                EXPECT_THROW(run(verb, arguments), std::out_of_range);
            }
        }
    }
}

constexpr int largeKeyCount = velkor::testing::isSanitized ? 50'000 : 1'000'000;

TEST_F(CommandInput, ListOfALargeStoreShowsEveryKey) {
    ValueMap values;
    std::size_t expectedSize = 0;
    for (int number = 0; number < largeKeyCount; ++number) {
        const std::string digits = std::to_string(number);
        expectedSize += 2 * digits.size() + std::string_view("key = \n").size();
        values.emplace("key" + digits, number);
    }
    store->addInMemorySource("large", "", 5, false, std::move(values));
    const std::string listed = run("list");
    EXPECT_EQ(listed.size(), expectedSize);
    EXPECT_EQ(listed.substr(0, 9), "key0 = 0\n");
}

}  // namespace
}  // namespace velkor::configuration
