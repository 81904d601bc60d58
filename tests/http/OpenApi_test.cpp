#include <Poco/Dynamic/Var.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <fstream>
#include <iterator>
#include <set>
#include <string>

#include "configuration/ConfigurationValue.hpp"
#include "http/detail/routes/Problem.hpp"
#include "http/detail/routes/Route.hpp"
#include "messages/JsonText.hpp"

// The description for machines, beside what there is.

namespace velkor::http::detail {
namespace {

using Poco::JSON::Array;
using Poco::JSON::Object;
using ::testing::UnorderedElementsAreArray;
using Names = std::set<std::string>;

Object::Ptr description() {
    std::ifstream file(VELKOR_OPENAPI);
    const std::string text{std::istreambuf_iterator<char>(file), {}};
    return messages::parseJsonObject(text, {});
}

std::string upper(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](char each) {
        return static_cast<char>(std::toupper(static_cast<unsigned char>(each)));
    });
    return text;
}

// "/config/{key}" is "/config/", as a route names what goes on.
std::string withoutArgument(const std::string& path) {
    return path.substr(0, path.find('{'));
}

Names parametersIn(const Object& operation) {
    Names names;
    const auto parameters = operation.getArray("parameters");
    if (parameters.isNull()) return names;
    for (const auto& each : *parameters) {
        names.insert(each.extract<Object::Ptr>()->getValue<std::string>("name"));
    }
    return names;
}

std::string textOf(const std::string& method, const std::string& path, const Names& parameters) {
    std::string text = method + ' ' + path;
    for (const auto& name : parameters) text += ' ' + name;
    return text;
}

/// "GET /config cursor limit prefix" for each operation that is described.
Names described() {
    Names texts;
    const auto paths = description()->getObject("paths");
    for (const auto& [path, item] : *paths) {
        for (const auto& [method, operation] : *item.extract<Object::Ptr>()) {
            if (method == "parameters") continue;
            texts.insert(textOf(upper(method), withoutArgument(path),
                                parametersIn(*operation.extract<Object::Ptr>())));
        }
    }
    return texts;
}

Names served() {
    Names texts;
    for (const Route& route : routes()) {
        Names parameters(route.parameters.begin(), route.parameters.end());
        parameters.erase("");
        texts.insert(textOf(std::string(route.method), std::string(route.path), parameters));
    }
    return texts;
}

Names enumIn(const std::string& schema, const std::string& property) {
    const auto values = description()
                            ->getObject("components")
                            ->getObject("schemas")
                            ->getObject(schema)
                            ->getObject("properties")
                            ->getObject(property)
                            ->getArray("enum");
    Names names;
    for (const auto& each : *values) names.insert(each.toString());
    return names;
}

TEST(OpenApi, DescribesEveryRouteAndNoOther) {
    EXPECT_THAT(described(), UnorderedElementsAreArray(served()));
}

TEST(OpenApi, NamesEveryTypeOfValue) {
    EXPECT_EQ(enumIn("Value", "type"),
              Names(configuration::typeTags.begin(), configuration::typeTags.end()));
}

TEST(OpenApi, NamesEveryTypeOfProblem) {
    Names types;
    for (int kind = 0; kind <= static_cast<int>(ProblemKind::unavailable); ++kind) {
        const auto response = problemResponse(static_cast<ProblemKind>(kind), "");
        types.insert(messages::parseJsonObject(response.body, {})->getValue<std::string>("type"));
    }
    EXPECT_EQ(enumIn("Problem", "type"), types);
}

}  // namespace
}  // namespace velkor::http::detail
