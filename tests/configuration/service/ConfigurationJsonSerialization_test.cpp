#include "configuration/service/ConfigurationJsonSerialization.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <ostream>
#include <set>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "configuration/service/ConfigurationMessages.hpp"
#include "tests/configuration/service/JsonForms.hpp"
#include "tests/configuration/service/MessageClasses.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using velkor::testing::JsonForms;
using velkor::testing::parseObject;
using velkor::testing::RecordingSerializer;
using velkor::testing::textOf;

const std::vector<std::string> names{"velkor/configuration/ConfigurationSet",
                                     "velkor/configuration/ConfigurationGet",
                                     "velkor/configuration/ConfigurationKeys",
                                     "velkor/configuration/ConfigurationKeysResponse",
                                     "velkor/configuration/ConfigurationOptionResponse",
                                     "velkor/configuration/AddPropertyFileSource"};

std::vector<std::string> each(const std::string& verb, std::size_t count) {
    std::vector<std::string> calls;
    for (std::size_t i = 0; i < count; ++i) calls.push_back(verb + " " + names[i]);
    return calls;
}

class Registration : public ::testing::Test {
protected:
    std::shared_ptr<RecordingSerializer> registry = std::make_shared<RecordingSerializer>();
};

TEST_F(Registration, NamesTheTypesInOrder) {
    const ConfigurationJsonSerialization registration(registry);
    EXPECT_EQ(registry->calls, each("register", names.size()));
}

TEST_F(Registration, PairsEachNameWithItsClass) {
    const ConfigurationJsonSerialization registration(registry);
    forEachMessageType([&](const auto& type) {
        using Class = typename std::decay_t<decltype(type)>::Class;
        EXPECT_EQ(registry->forms.at(typeid(Class)).name, type.name());
    });
}

TEST_F(Registration, IsWithdrawnInTheSameOrder) {
    { const ConfigurationJsonSerialization registration(registry); }
    auto expected = each("register", names.size());
    const auto withdrawals = each("unregister", names.size());
    expected.insert(expected.end(), withdrawals.begin(), withdrawals.end());
    EXPECT_EQ(registry->calls, expected);
}

TEST_F(Registration, KeepsTheRegistryAlive) {
    const std::weak_ptr<RecordingSerializer> observer = registry;
    {
        const ConfigurationJsonSerialization registration(std::move(registry));
        EXPECT_FALSE(observer.expired());
    }
    EXPECT_TRUE(observer.expired());
}

TEST_F(Registration, RefusedByTheRegistryPassesOnWhatItThrew) {
    registry->refused = names[3];
    EXPECT_THROW(ConfigurationJsonSerialization{registry}, std::runtime_error);
}

TEST_F(Registration, RefusedByTheRegistryWithdrawsWhatItTook) {
    registry->refused = names[3];
    EXPECT_ANY_THROW(ConfigurationJsonSerialization{registry});
    registry->calls.erase(registry->calls.begin(), registry->calls.begin() + 3);
    EXPECT_EQ(registry->calls, each("unregister", 3));
}

class FailingSerializer : public RecordingSerializer {
public:
    void unregisterMessage(const std::type_info&) override { throw std::runtime_error("broken"); }
};

TEST(RegistrationDeathTest, FailureToWithdrawEndsTheProcess) {
    ::testing::FLAGS_gtest_death_test_style = "threadsafe";
    EXPECT_DEATH(
        { ConfigurationJsonSerialization registration(std::make_shared<FailingSerializer>()); },
        "broken");
}

class MessageJson : public ::testing::Test {
protected:
    JsonForms forms;
};

// ---- Writing: members appear in ascending order of their names

TEST_F(MessageJson, GetIsWrittenAsItsKey) {
    EXPECT_EQ(forms.toText(ConfigurationGet("a.b")), R"({"key":"a.b"})");
}

TEST_F(MessageJson, SetIsWrittenWithKeySourceAndValue) {
    EXPECT_EQ(forms.toText(ConfigurationSet("k", 5, "s")),
              R"({"key":"k","source":"s","value":{"type":"int","value":5}})");
}

TEST_F(MessageJson, KeysIsWrittenAsAnEmptyObject) {
    ConfigurationKeys request;
    request.filter = "ignored";
    EXPECT_EQ(forms.toText(std::move(request)), "{}");
}

TEST_F(MessageJson, KeysResponseIsWrittenInAscendingOrder) {
    EXPECT_EQ(forms.toText(ConfigurationKeysResponse({"b", "a", "B"})),
              R"({"keys":["B","a","b"]})");
}

TEST_F(MessageJson, KeysResponseWithoutKeysIsWrittenWithAnEmptyArray) {
    EXPECT_EQ(forms.toText(ConfigurationKeysResponse()), R"({"keys":[]})");
}

TEST_F(MessageJson, OptionResponseIsWrittenWithItsOptionAtTheTop) {
    EXPECT_EQ(
        forms.toText(ConfigurationOptionResponse(std::make_unique<Option>("k", "override", true))),
        R"({"key":"k","source":"override","value":{"type":"bool","value":true}})");
}

TEST_F(MessageJson, OptionResponseWithoutOptionIsWrittenAsAnEmptyObject) {
    EXPECT_EQ(forms.toText(ConfigurationOptionResponse()), "{}");
}

TEST_F(MessageJson, AddPropertyFileSourceIsWrittenWithAllItsFields) {
    EXPECT_EQ(
        forms.toText(AddPropertyFileSource("n", "g.", -1, false, u"/\u00e9")),
        "{\"group\":\"g.\",\"name\":\"n\",\"order\":-1,\"path\":\"/\u00e9\",\"readOnly\":false}");
}

TEST_F(MessageJson, EachWrittenObjectIsANewOne) {
    EXPECT_NE(forms.toObject(ConfigurationKeys()).get(), forms.toObject(ConfigurationKeys()).get());
}

// ---- Reading

TEST_F(MessageJson, GetIsRead) {
    EXPECT_EQ(forms.fromText<ConfigurationGet>(R"({"key":"a.b"})")->key, "a.b");
}

TEST_F(MessageJson, SetIsRead) {
    const auto request = forms.fromText<ConfigurationSet>(
        R"({"key":"k","source":"s","value":{"type":"uint","value":7}})");
    EXPECT_EQ(request->key, "k");
    EXPECT_EQ(request->source, "s");
    EXPECT_EQ(textOf(request->value), "uint 7");
}

TEST_F(MessageJson, SetWithoutValueIsReadWithAnEmptyText) {
    EXPECT_EQ(textOf(forms.fromText<ConfigurationSet>(R"({"key":"k"})")->value), "string ");
}

TEST_F(MessageJson, KeysIsReadWithoutLookingAtTheObject) {
    EXPECT_EQ(forms.fromText<ConfigurationKeys>(R"({"filter":"x","key":1})")->filter, "");
}

TEST_F(MessageJson, KeysResponseIsReadWithoutDuplicates) {
    const auto response = forms.fromText<ConfigurationKeysResponse>(R"({"keys":["b","a","b"]})");
    EXPECT_EQ(response->keys, (std::set<std::string>{"a", "b"}));
    EXPECT_EQ(forms.toText(std::move(*response)), R"({"keys":["a","b"]})");
}

TEST_F(MessageJson, KeyThatCannotBeConvertedIsReadAsTheEmptyKey) {
    EXPECT_EQ(forms.fromText<ConfigurationKeysResponse>(R"({"keys":["a",null,1]})")->keys,
              (std::set<std::string>{"", "1", "a"}));
}

TEST_F(MessageJson, KeysThatAreNoArrayAreNone) {
    EXPECT_TRUE(forms.fromText<ConfigurationKeysResponse>(R"({"keys":{"a":1}})")->keys.empty());
    EXPECT_TRUE(forms.fromText<ConfigurationKeysResponse>(R"({"keys":"a"})")->keys.empty());
    EXPECT_TRUE(forms.fromText<ConfigurationKeysResponse>("{}")->keys.empty());
}

TEST_F(MessageJson, OptionResponseIsRead) {
    const auto response = forms.fromText<ConfigurationOptionResponse>(
        R"({"key":"k","source":"s","value":{"type":"double","value":0.5}})");
    ASSERT_NE(response->option, nullptr);
    EXPECT_EQ(response->option->key, "k");
    EXPECT_EQ(response->option->source, "s");
    EXPECT_EQ(textOf(response->option->value), "double 0.5");
}

TEST_F(MessageJson, OptionResponseWithoutKeyAndSourceIsReadWithEmptyOnes) {
    const auto response = forms.fromText<ConfigurationOptionResponse>(R"({"value":{}})");
    ASSERT_NE(response->option, nullptr);
    EXPECT_EQ(response->option->key, "");
    EXPECT_EQ(response->option->source, "");
    EXPECT_EQ(textOf(response->option->value), "string ");
}

TEST_F(MessageJson, OptionResponseWithoutValueObjectHasNoOption) {
    for (const char* text : {R"({"key":"k","source":"s"})", "{}", R"({"value":null})",
                             R"({"value":[1]})", R"({"key":"k","value":"int"})"}) {
        EXPECT_EQ(forms.fromText<ConfigurationOptionResponse>(text)->option, nullptr) << text;
    }
}

TEST_F(MessageJson, OptionResponseWhoseValueIsANullObjectHasNoOption) {
    Poco::JSON::Object::Ptr object = new Poco::JSON::Object;
    object->set("value", Poco::JSON::Object::Ptr());
    EXPECT_EQ(forms.fromObject<ConfigurationOptionResponse>(object)->option, nullptr);
}

TEST_F(MessageJson, AddPropertyFileSourceIsRead) {
    const auto request = forms.fromText<AddPropertyFileSource>(
        R"({"name":"n","group":"g","order":-5,"readOnly":false,"path":"/\u20ac"})");
    EXPECT_EQ(request->name, "n");
    EXPECT_EQ(request->group, "g");
    EXPECT_EQ(request->order, -5);
    EXPECT_FALSE(request->readOnly);
    EXPECT_EQ(request->path, u"/\u20ac");
}

TEST_F(MessageJson, PathBeyondTheBasicPlaneIsReadBackUnchanged) {
    const AddPropertyFileSource request("n", "g", 0, true, u"/\U0001d11e");
    EXPECT_EQ(forms.fromObject<AddPropertyFileSource>(forms.toObject(request))->path,
              u"/\U0001d11e");
}

TEST_F(MessageJson, AddPropertyFileSourceWithoutMembersIsReadOnlyAndElseEmpty) {
    const auto request = forms.fromText<AddPropertyFileSource>("{}");
    EXPECT_EQ(request->name, "");
    EXPECT_EQ(request->group, "");
    EXPECT_EQ(request->order, 0);
    EXPECT_TRUE(request->readOnly);
    EXPECT_EQ(request->path, u"");
}

struct Flag {
    std::string name;
    std::string json;
    bool readOnly;
};

void PrintTo(const Flag& flag, std::ostream* out) {
    *out << flag.json;
}

class ReadOnlyFlag : public ::testing::TestWithParam<Flag> {};

TEST_P(ReadOnlyFlag, ReadsAsTheTableSays) {
    const std::string text = R"({"readOnly":)" + GetParam().json + "}";
    EXPECT_EQ(JsonForms().fromText<AddPropertyFileSource>(text)->readOnly, GetParam().readOnly);
}

INSTANTIATE_TEST_SUITE_P(
    Json, ReadOnlyFlag,
    ::testing::Values(Flag{"False", "false", false}, Flag{"Null", "null", true},
                      Flag{"Zero", "0", false}, Flag{"EmptyText", "\"\"", true},
                      Flag{"AnyText", "\"x\"", true}, Flag{"NoInText", "\"no\"", false},
                      Flag{"OffInText", "\"off\"", false}, Flag{"ZeroInText", "\"0\"", false},
                      Flag{"FalseInText", "\"False\"", false}, Flag{"YesInText", "\"yes\"", true},
                      Flag{"EmptyObject", "{}", false}, Flag{"EmptyArray", "[]", false}),
    [](const auto& tested) { return tested.param.name; });

TEST_F(MessageJson, OrderOutOfRangeIsZero) {
    EXPECT_EQ(forms.fromText<AddPropertyFileSource>(R"({"order":2147483648})")->order, 0);
}

TEST_F(MessageJson, MembersOfOtherNamesAreIgnored) {
    EXPECT_EQ(forms.fromText<ConfigurationGet>(R"({"Key":"x","keys":"y","":1})")->key, "");
}

TEST_F(MessageJson, ScalarMembersConvert) {
    const auto request = forms.fromText<ConfigurationSet>(R"({"key":5,"source":true})");
    EXPECT_EQ(request->key, "5");
    EXPECT_EQ(request->source, "true");
}

template <class M>
class AnyMessageJson : public MessageJson {};

TYPED_TEST_SUITE(AnyMessageJson, velkor::testing::EveryMessageClass, );

TYPED_TEST(AnyMessageJson, NullObjectReadsLikeAnEmptyOne) {
    EXPECT_EQ(this->forms.toText(std::move(*this->forms.template fromObject<TypeParam>(nullptr))),
              this->forms.toText(std::move(*this->forms.template fromText<TypeParam>("{}"))));
}

TYPED_TEST(AnyMessageJson, WrittenTextReadsBackToTheSameText) {
    const std::string text = R"({"key":"k","source":"s","value":{"type":"intArray","value":[1,2]},
        "keys":["a"],"name":"n","group":"g","order":3,"readOnly":false,"path":"p"})";
    const std::string written =
        this->forms.toText(std::move(*this->forms.template fromText<TypeParam>(text)));
    EXPECT_EQ(this->forms.toText(std::move(*this->forms.template fromText<TypeParam>(written))),
              written);
}

TYPED_TEST(AnyMessageJson, ReadingLeavesTheObjectAlone) {
    const auto object =
        parseObject(R"({"key":"k","value":{"type":"int","value":"5"},"order":"3"})");
    const std::string before = velkor::testing::textOfObject(*object);
    this->forms.template fromObject<TypeParam>(object);
    EXPECT_EQ(velkor::testing::textOfObject(*object), before);
}

}  // namespace
}  // namespace velkor::configuration
