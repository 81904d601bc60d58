#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/ValueTable.hpp"

namespace velkor::layers::detail {

/// What makes the values of one table those of another. Copies no value.
class TableChange {
public:
    /// From `before`, which holds `sizeBefore` keys and stays as it is until this is applied, to
    /// `after`.
    TableChange(const configuration::ValueTable& before, std::size_t sizeBefore,
                configuration::ValueMap&& after);

    bool isEmpty() const { return keys.empty(); }

    /// How many keys there are afterwards.
    std::size_t sizeAfter() const { return size; }

    /// Makes `table`, which was `before`, what was `after`. Once. Gives the keys that have changed;
    /// the values that they had are destroyed with this. What lack of memory throws leaves the
    /// table as it was.
    std::vector<std::string> applyTo(configuration::ValueTable& table);

private:
    using Node = configuration::ValueMap::node_type;

    void insertAdded(configuration::ValueTable& table);

    std::size_t size;
    std::vector<Node> added;
    std::vector<Node> replaced;
    std::vector<std::string> removed;
    std::vector<configuration::ConfigurationValue> dropped;  // the values of those removed
    std::vector<std::string> keys;                           // all of them
};

}  // namespace velkor::layers::detail
