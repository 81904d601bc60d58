#pragma once

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "fuzz/http/ModelFeed.hpp"
#include "fuzz/http/Sent.hpp"
#include "settings/Setting.hpp"

namespace velkor::fuzz::http {

/// What a server may do.
struct Manner {
    bool hasTokens = false;  ///< There are `readToken` and `writeToken`.
    bool allowsWrites = false;
};

/// An answer, as far as it is documented.
struct Expected {
    int status = 200;
    std::string contentType{};
    std::optional<std::string> body{};  ///< Nothing: any but an empty one.
    std::vector<std::pair<std::string, std::string>> headers{};
    std::unique_ptr<ModelFeed> feed{};  ///< Not null: it is a stream.
};

/// The layers of the stores that the server and its model begin with: beside the usual ones one
/// that can't be written, with the group "s.".
std::shared_ptr<configuration::ConfigurationImpl> makeStore();

/// The secret setting that is declared of each: "s.pin".
settings::Setting<int> declarePin(const std::shared_ptr<configuration::ConfigurationImpl>& store);

/// What docs/http-api.md and docs/security.md say, rule by rule, over a store of its own. The store
/// itself, the lenient reading of messages and settings are not looked at here: others do so.
class ModelServer {
public:
    explicit ModelServer(Manner itsManner);

    /// What `request` is answered with.
    Expected answer(const Request& request);

private:
    using Parameters = std::vector<std::pair<std::string, std::string>>;

    Expected answerKnown(const Request& request, const std::string& path, const std::string& query);
    Expected answerMessage(const Request& request, const std::string& type);
    Expected optionReply(const configuration::Option& option) const;
    Expected answerPatch(const Request& request, const Parameters& parameters);
    Expected answerRead(const std::string& path, const Parameters& parameters, bool isHead);
    Expected page(const Parameters& parameters);
    Expected layers(const std::string& key);
    std::string sources() const;
    std::string settingList() const;
    std::string declared(const std::string& key) const;
    bool mayRead(const Request& request) const;
    bool mayWrite(const Request& request) const;

    const Manner manner;
    const std::shared_ptr<configuration::ConfigurationImpl> store = makeStore();
    const settings::Setting<int> pin = declarePin(store);
    bool writes = false;  // whether who sent the present request may
};

}  // namespace velkor::fuzz::http
