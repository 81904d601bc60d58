#pragma once

#include <Poco/AutoPtr.h>
#include <Poco/Util/LayeredConfiguration.h>
#include <Poco/Util/MapConfiguration.h>
#include <glib.h>

#include <boost/property_tree/ptree.hpp>
#include <cstddef>
#include <memory>
#include <string>

#include "benchmarks/support/Fixtures.hpp"

namespace velkor::benchmarks {

/// POCO's layers, which hold text: `count` keys of `value` in each, all but the last of which are
/// keys that nobody asks for.
inline Poco::AutoPtr<Poco::Util::LayeredConfiguration> pocoLayers(std::size_t layers,
                                                                  std::size_t count,
                                                                  const std::string& value) {
    Poco::AutoPtr<Poco::Util::LayeredConfiguration> all(new Poco::Util::LayeredConfiguration);
    for (std::size_t layer = 0; layer < layers; ++layer) {
        Poco::AutoPtr<Poco::Util::MapConfiguration> one(new Poco::Util::MapConfiguration);
        const std::string mark = layer + 1 == layers ? "" : "." + std::to_string(layer);
        for (std::size_t i = 0; i < count; ++i) one->setString(keyNumber(i) + mark, value);
        all->add(one, static_cast<int>(layer), true);
    }
    return all;
}

/// Boost.PropertyTree: a tree of the keys' parts, whose children are found one by one.
inline boost::property_tree::ptree propertyTree(std::size_t count, const std::string& value) {
    boost::property_tree::ptree tree;
    for (std::size_t i = 0; i < count; ++i) tree.put(keyNumber(i), value);
    return tree;
}

/// GLib's key file: one group, text.
inline std::shared_ptr<GKeyFile> keyFile(std::size_t count, const std::string& value) {
    const std::shared_ptr<GKeyFile> file(g_key_file_new(), g_key_file_unref);
    for (std::size_t i = 0; i < count; ++i) {
        g_key_file_set_value(file.get(), keyGroup.c_str(), relativeKeyNumber(i).c_str(),
                             value.c_str());
    }
    return file;
}

/// `key` as a key file knows it.
inline const char* withinGroup(const std::string& key) {
    return key.c_str() + keyGroup.size() + 1;
}

}  // namespace velkor::benchmarks
