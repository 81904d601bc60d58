#include "host/Options.hpp"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <iterator>
#include <limits>
#include <string_view>
#include <utility>

#include "host/BracketGuard.hpp"
#include "host/CommaList.hpp"
#include "host/Severities.hpp"
#include "host/sources/EtcdOption.hpp"

namespace velkor::host {

namespace {

constexpr const char* description =
    "Looks into a layered configuration, and changes it, by commands.\n"
    "Commands are read from the terminal or from standard input; 'help' lists them.";

constexpr const char* footer =
    "Values of later files override those of earlier ones, --etcd overrides the files, --env "
    "etcd,\n"
    "--set the environment, and what 'set' writes overrides them all, unless an order says\n"
    "otherwise: the smaller order wins.\n"
    "Settings of --etcd are prefix=P, name=NAME, group=G, order=N, writable, compare-and-swap,\n"
    "ca=FILE, cert=FILE, key=FILE, user=NAME, password-file=FILE, wait=TIME, last-known=FILE and\n"
    "without-server=fail|last-known|empty.\n"
    "With --env APP_ the variable APP_SERVER__MAX_SIZE is server.max_size.\n"
    "On a terminal, and with --listen, files are read again when they change, unless an option\n"
    "says otherwise.\n"
    "Behind -- stands one command, whose words are taken as they are.\n"
    "With --listen commands come from -c or from behind --, and with --console as they do without\n"
    "it. SIGINT and SIGTERM end it.\n"
    "SIZE is a number of bytes, also with KiB, MiB or GiB behind it. TIME has a unit: 250ms, 10s.\n"
    "SEVERITIES are fatal, error, warning, debug, trace, or sums of 1, 2, 4, 8 and 16,\n"
    "separated by commas.\n"
    "\n"
    "Exit status: 0 fine, 1 a command failed or --check found something, 2 bad usage, 3 a source "
    "or\n"
    "the state could not be loaded.";

constexpr const char* commandMark = "--";
constexpr const char* groupSetting = "group=";
constexpr const char* orderSetting = "order=";
constexpr const char* writableSetting = "writable";

struct SizeUnit {
    std::string_view name;
    std::uintmax_t bytes;
};

constexpr SizeUnit sizeUnits[] = {
    {"", 1},
    {"KiB", std::uintmax_t{1} << 10U},
    {"MiB", std::uintmax_t{1} << 20U},
    {"GiB", std::uintmax_t{1} << 30U},
};

[[noreturn]] void fail(const std::string& option, const std::string& text,
                       const std::string& reason) {
    throw UsageError(option + ' ' + text + ": " + reason);
}

std::optional<std::string> valueOf(std::string_view setting, std::string_view name) {
    if (setting.substr(0, name.size()) != name) return std::nullopt;
    return std::string(setting.substr(name.size()));
}

void applySetting(SourceRequest& request, const std::string& setting, const std::string& text) {
    if (const auto group = valueOf(setting, groupSetting)) {
        request.group = *group;
    } else if (const auto orderText = valueOf(setting, orderSetting)) {
        const auto order = parseOrder(*orderText);
        if (!order) fail("--source", text, "the order is no number of 32 bits: " + *orderText);
        request.order = *order;
    } else if (setting == writableSetting) {
        request.writable = true;
    } else {
        fail("--source", text, "unknown setting: " + setting);
    }
}

SourceRequest environment(const std::string& prefix) {
    SourceRequest request{std::nullopt, prefix};
    request.order = SourceRequest::environmentOrder;
    request.kind = "environment";
    return request;
}

/// The command line's options, as the parsing library knows them.
class Parser {
public:
    Parser() {
        app.set_help_flag("-h,--help", "Show this text.");
        app.set_version_flag("--version", "velkor-config " VELKOR_VERSION, "Show the version.");
        add(files, "FILE", "", "A property file, added as a read-only source.");
        add(sources, "--source", "NAME=PATH[,group=G][,order=N][,writable]",
            "A property file with all that a source has.");
        add(layersInEtcd, "--etcd", "URL[,URL...][,prefix=P][,SETTING...]",
            "Add the values below P in etcd, whose members are at the URLs, and follow them.");
        add(environments, "--env", "PREFIX",
            "Add the environment variables that begin with PREFIX.");
        add(assignments, "--set", "KEY=VALUE", "A value in front of files and environment.");
        add(states, "--state", "FILE",
            "Keep what is set in FILE, with its history; made when missing.");
        addFlag("--watch-files", true, "Read files again when they change.");
        addFlag("--no-watch-files", false, "Read files once; as without a terminal.");
        app.add_flag("--check", checksFiles, "Tell what is wrong with the files, and end.");
        add(fileSizes, "--max-file-size", "SIZE",
            "The largest property file that is read; 256MiB unless given.");
        add(lines, "-c", "LINE", "Carry out LINE instead of reading commands; repeatable.");
        app.add_flag_callback(
            "--no-history", [this] { keepsHistory = false; },
            "Keep what is typed at the prompt for this session only.");
        add(logs, "--log", "CHANNEL=SEVERITIES", "Write a log channel to standard error.");
        app.add_option("--manual", manualForm)->group("");  // for whoever builds the program
        listenOptions.emplace(app);
        app.footer(footer);
    }

    ProgramUsage usage() const {
        ProgramUsage usage{description, footer};
        for (const CLI::Option* option : app.get_options()) {
            if (option->get_group().empty()) continue;
            usage.options.push_back({namesOf(*option),
                                     option->get_positional() ? "" : option->get_type_name(),
                                     option->get_description()});
        }
        return usage;
    }

    Options parse(std::vector<std::string> arguments) {
        Options options;
        options.command = takeCommand(arguments);
        try {
            std::vector<std::string> reversed;
            std::transform(arguments.rbegin(), arguments.rend(), std::back_inserter(reversed),
                           guarded);
            app.parse(std::move(reversed));
        } catch (const CLI::CallForHelp&) {
            options.information = app.help();
            return options;
        } catch (const CLI::CallForVersion&) {
            options.information = app.version();
            return options;
        } catch (const CLI::ParseError& error) {
            throw UsageError(std::string(error.what()) + " (see --help)");
        }
        for (const auto& text : lines.texts) options.lines.push_back(unguarded(text));
        for (const auto& text : logs.texts) options.logs.push_back(parseLog(unguarded(text)));
        for (const auto& text : fileSizes.texts) options.limits.fileBytes = parseFileSize(text);
        for (const auto& text : assignments.texts) {
            options.assignments.push_back(parseAssignment(unguarded(text)));
        }
        if (!options.lines.empty() && !options.command.empty()) {
            throw UsageError("-c LINE and -- COMMAND can't both be carried out (see --help)");
        }
        if (!states.texts.empty()) options.statePath = unguarded(states.texts.back());
        options.watchesFiles = watchesFiles;
        options.checksFiles = checksFiles;
        options.manualForm = manualForm;
        options.keepsHistory = keepsHistory;
        collectSources(options);
        options.serving = listenOptions->request();
        if (options.serving) {
            options.serving->server.maxPropertyFileBytes = options.limits.fileBytes;
        }
        if (checksFiles) requireFilesOnly(options);
        return options;
    }

private:
    struct Repeatable {
        CLI::Option* option = nullptr;
        std::vector<std::string> texts{};
    };

    void add(Repeatable& added, const char* name, const char* value, const char* help) {
        added.option = app.add_option(name, added.texts, help);
        added.option->allow_extra_args(added.option->get_positional())->type_name(value);
    }

    // What the check of files would leave out without a word.
    static void requireFilesOnly(const Options& options) {
        if (options.givesCommands() || options.serving) {
            throw UsageError("--check goes without -c LINE, -- COMMAND and --listen (see --help)");
        }
        const bool hasFile = std::any_of(options.sources.begin(), options.sources.end(),
                                         [](const auto& source) { return source.isFile(); });
        if (!hasFile) throw UsageError("--check: a FILE is needed");
    }

    static std::vector<std::string> namesOf(const CLI::Option& option) {
        if (option.get_positional()) return {option.get_name(true)};
        std::vector<std::string> names;
        for (const auto& name : option.get_snames()) names.push_back('-' + name);
        for (const auto& name : option.get_lnames()) names.push_back("--" + name);
        return names;
    }

    // Takes what stands behind "--" away, which no option's value can be.
    static std::vector<std::string> takeCommand(std::vector<std::string>& arguments) {
        const auto mark = std::find(arguments.begin(), arguments.end(), commandMark);
        if (mark == arguments.end()) return {};
        std::vector<std::string> command(mark + 1, arguments.end());
        if (command.empty()) throw UsageError("-- needs a COMMAND (see --help)");
        arguments.erase(mark, arguments.end());
        return command;
    }

    // Of several the last one counts.
    void addFlag(const char* name, bool watches, const char* help) {
        app.add_flag_callback(
               name, [this, watches] { watchesFiles = watches; }, help)
            ->trigger_on_parse();
    }

    // Files, --source and --etcd options may be mixed: their order on the command line matters.
    // That of the environment doesn't.
    void collectSources(Options& options) const {
        auto file = files.texts.begin();
        auto source = sources.texts.begin();
        auto layer = layersInEtcd.texts.begin();
        for (const CLI::Option* option : app.parse_order()) {
            if (option == files.option) {
                options.sources.push_back(SourceRequest{std::nullopt, unguarded(*file++)});
            } else if (option == sources.option) {
                options.sources.push_back(parseSource(unguarded(*source++)));
            } else if (option == layersInEtcd.option) {
                options.sources.push_back(parseEtcd(unguarded(*layer++)));
            }
        }
        for (const auto& text : environments.texts) {
            options.sources.push_back(environment(unguarded(text)));
        }
    }

    CLI::App app{description, "velkor-config"};
    Repeatable files;
    Repeatable sources;
    Repeatable layersInEtcd;
    Repeatable environments;
    Repeatable assignments;
    Repeatable states;
    std::optional<bool> watchesFiles;
    bool checksFiles = false;
    std::string manualForm;
    bool keepsHistory = true;
    Repeatable fileSizes;
    Repeatable lines;
    Repeatable logs;
    std::optional<ListenOptions> listenOptions;  // made last: the help shows them behind the others
};

}  // namespace

Options parseOptions(const std::vector<std::string>& arguments) {
    return Parser().parse(arguments);
}

ProgramUsage programUsage() {
    return Parser().usage();
}

SourceRequest parseSource(const std::string& text) {
    const auto parts = splitAtCommas(text);
    const std::size_t equals = parts.front().find('=');
    if (equals == std::string::npos || equals == 0 || equals + 1 == parts.front().size()) {
        fail("--source", text, "NAME=PATH is needed");
    }
    SourceRequest request{parts.front().substr(0, equals), parts.front().substr(equals + 1)};
    for (std::size_t i = 1; i < parts.size(); ++i) applySetting(request, parts[i], text);
    return request;
}

Assignment parseAssignment(const std::string& text) {
    const std::size_t equals = text.find('=');
    if (equals == std::string::npos || equals == 0) fail("--set", text, "KEY=VALUE is needed");
    return {text.substr(0, equals), text.substr(equals + 1)};
}

std::uintmax_t parseFileSize(const std::string& text) {
    std::uintmax_t count = 0;
    const char* const end = text.data() + text.size();
    const auto [unitText, error] = std::from_chars(text.data(), end, count);
    const std::string_view unit(unitText, static_cast<std::size_t>(end - unitText));
    const auto* const found = std::find_if(std::begin(sizeUnits), std::end(sizeUnits),
                                           [&](const auto& each) { return each.name == unit; });
    const bool isKnown = error == std::errc() && found != std::end(sizeUnits);
    if (!isKnown || count > std::numeric_limits<std::uintmax_t>::max() / found->bytes) {
        fail("--max-file-size", text, "a number of bytes is needed, such as 1048576 or 64MiB");
    }
    return count * found->bytes;
}

LogRequest parseLog(const std::string& text) {
    const std::size_t equals = text.find('=');
    if (equals == std::string::npos || equals == 0) {
        fail("--log", text, "CHANNEL=SEVERITIES is needed");
    }
    try {
        return {text.substr(0, equals), parseSeverities(text.substr(equals + 1))};
    } catch (const std::invalid_argument& error) {
        fail("--log", text, error.what());
    }
}

}  // namespace velkor::host
