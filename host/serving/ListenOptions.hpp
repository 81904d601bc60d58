#pragma once

#include <list>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "http/ServerOptions.hpp"

namespace CLI {
class App;
class Option;
}  // namespace CLI

namespace velkor::host {

/// What the command line says about serving.
struct ListenRequest {
    http::ServerOptions server{};
    bool withConsole = false;  ///< The session goes on beside it, and ends it.
};

/// The options of the command line about serving, as the parsing library knows them: one for each
/// member of `http::ServerOptions`, whose defaults they show in the help.
class ListenOptions {
public:
    /// Adds them to `app`, which must live as long.
    explicit ListenOptions(CLI::App& app);
    ListenOptions(const ListenOptions&) = delete;
    ListenOptions& operator=(const ListenOptions&) = delete;

    /// What was parsed; nothing without --listen. Throws `UsageError`:
    ///
    /// - "--NAME needs --listen", when another of the options was given without that;
    /// - "--NAME TEXT: REASON", when the text is no such number, size or time.
    std::optional<ListenRequest> request() const;

private:
    struct Given {
        std::string name;
        CLI::Option* option;
        std::vector<std::string> texts;
    };

    void add(CLI::App& app, const std::string& name, const char* type, const std::string& help);
    void addFlag(CLI::App& app, const std::string& name, const std::string& help);
    const Given& find(std::string_view name) const;
    bool isGiven(std::string_view name) const;
    std::vector<std::string> textsOf(std::string_view name) const;
    std::string lastOf(std::string_view name) const;

    std::list<Given> options;  // the parsing library keeps references to the texts
};

}  // namespace velkor::host
