#pragma once

#include <string>
#include <typeindex>
#include <unordered_map>
#include <utility>

#include "framework/json/JsonSerializer.hpp"

namespace velkor::benchmarks {

/// A registry that only keeps the functions, by the message's type.
class FormTable : public json::JsonSerializer {
public:
    struct Form {
        Serialise serialise;
        Deserialise deserialise;
    };

    void registerMessage(const std::string&, const std::type_info& type, Serialise serialise,
                         Deserialise deserialise) override {
        forms.insert_or_assign(type, Form{std::move(serialise), std::move(deserialise)});
    }

    void unregisterMessage(const std::type_info& type) override { forms.erase(type); }

    /// The functions for messages of type `M`.
    template <class M>
    Form formOf() const {
        return forms.at(typeid(M));
    }

private:
    std::unordered_map<std::type_index, Form> forms;
};

}  // namespace velkor::benchmarks
