#pragma once

#include <memory>
#include <string>

#include "configuration/Configuration.hpp"
#include "framework/Future.hpp"
#include "framework/Message.hpp"

namespace velkor::testing {

/// A message of the plugin's own, known to the host by this declaration only.
struct LoadedMessage : Message {
    std::string text = "from the plugin";
};

/// What the plugin gives its host, by way of `velkorLoadedObjects`.
struct LoadedObjects {
    std::shared_ptr<configuration::Configuration> store;
    std::unique_ptr<Message> ownMessage;
    std::unique_ptr<Message> plainMessage;
    Future<std::unique_ptr<Message>> failed;
};

}  // namespace velkor::testing

// The functions that the plugin exports; hosts look them up by name.
extern "C" {

/// Makes a store, uses every part of it and destroys it. Writes to `complaint` when that fails.
/// `propertyFile` is the UTF-8 path of a file with the one line "file.key=file value".
using VelkorUseConfiguration = void(const char* propertyFile, std::string& complaint);
VelkorUseConfiguration velkorUseConfiguration;

/// Fills `objects`, which the host destroys before it unloads the plugin.
using VelkorLoadedObjects = void(velkor::testing::LoadedObjects& objects);
VelkorLoadedObjects velkorLoadedObjects;

/// Whether the plugin recognises a message of the host as a `LoadedMessage`.
using VelkorRecognises = bool(const velkor::Message& message);
VelkorRecognises velkorRecognises;
}
