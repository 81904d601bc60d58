#include "host/sources/EtcdOption.hpp"

#include <algorithm>
#include <chrono>
#include <iterator>
#include <set>
#include <stdexcept>
#include <string_view>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "host/CommaList.hpp"
#include "host/Options.hpp"
#include "settings/Conversion.hpp"

namespace velkor::host {

namespace {

using layers::EtcdOptions;
using layers::StartWithoutServer;
using std::chrono::milliseconds;

constexpr std::string_view plainScheme = "http://";
constexpr std::string_view secureScheme = "https://";

/// What stands behind the URLs. Where `value` is empty there is none.
struct Setting {
    std::string_view name;
    std::string_view value;

    /// Throws `std::invalid_argument` with the reason.
    void (*apply)(SourceRequest& request, const std::string& text);
    bool mayBeEmpty = false;
};

struct NamedStart {
    std::string_view name;
    StartWithoutServer start;
};

constexpr NamedStart starts[] = {
    {"fail", StartWithoutServer::fail},
    {"last-known", StartWithoutServer::lastKnown},
    {"empty", StartWithoutServer::empty},
};

void readOrder(SourceRequest& request, const std::string& text) {
    const auto order = parseOrder(text);
    if (!order) throw std::invalid_argument("the order is no number of 32 bits: " + text);
    request.order = *order;
}

void readWait(SourceRequest& request, const std::string& text) {
    const auto time =
        settings::Conversion<milliseconds>::from(configuration::ConfigurationValue(text));
    if (!time) throw std::invalid_argument("wait=" + text + ": " + time.reason().text);
    if (time.value() < milliseconds::zero()) {
        throw std::invalid_argument("wait=" + text + ": less than no time");
    }
    request.etcd->options.startWithin = time.value();
}

void readStart(SourceRequest& request, const std::string& text) {
    const auto* const found = std::find_if(std::begin(starts), std::end(starts),
                                           [&](const auto& each) { return each.name == text; });
    if (found == std::end(starts)) {
        throw std::invalid_argument("without-server=" + text +
                                    ": one of fail, last-known, empty is needed");
    }
    request.etcd->options.withoutServer = found->start;
}

template <auto EtcdOptions::*member>
void readOption(SourceRequest& request, const std::string& text) {
    request.etcd->options.*member = text;
}

constexpr Setting knownSettings[] = {
    {"prefix", "P", [](auto& request, const auto& text) { request.etcd->prefix = text; }, true},
    {"name", "NAME", [](auto& request, const auto& text) { request.name = text; }},
    {"group", "G", [](auto& request, const auto& text) { request.group = text; }, true},
    {"order", "N", readOrder},
    {"writable", "", [](auto& request, const auto&) { request.writable = true; }},
    {"compare-and-swap", "",
     [](auto& request, const auto&) { request.etcd->options.compareAndSwap = true; }},
    {"ca", "FILE", readOption<&EtcdOptions::caFile>},
    {"cert", "FILE", readOption<&EtcdOptions::certificateFile>},
    {"key", "FILE", readOption<&EtcdOptions::keyFile>},
    {"user", "NAME", readOption<&EtcdOptions::user>},
    {"password-file", "FILE", readOption<&EtcdOptions::passwordFile>},
    {"wait", "TIME", readWait},
    {"last-known", "FILE",
     [](auto& request, const auto& text) { request.etcd->options.lastKnownFile = text; }},
    {"without-server", "fail|last-known|empty", readStart},
};

const Setting* findSetting(std::string_view name) {
    const auto* const found = std::find_if(std::begin(knownSettings), std::end(knownSettings),
                                           [&](const auto& each) { return each.name == name; });
    return found == std::end(knownSettings) ? nullptr : found;
}

std::string_view nameOf(std::string_view part) {
    return part.substr(0, part.find('='));
}

bool isSecureUrl(std::string_view part) {
    return part.substr(0, secureScheme.size()) == secureScheme;
}

bool isUrl(std::string_view part) {
    return part.substr(0, plainScheme.size()) == plainScheme || isSecureUrl(part);
}

/// Takes a whole option apart.
class Reader {
public:
    explicit Reader(const std::string& text) : parts(splitAtCommas(text)) {
        request.kind = SourceRequest::etcdKind;
        request.order = SourceRequest::etcdOrder;
        request.etcd.emplace();
    }

    SourceRequest read() {
        refuseUsersInUrls();
        collectUrls();
        try {
            for (const auto& part : parts) {
                if (!isUrl(part)) readSetting(part);
            }
            completeStart();
            refuseHalves();
        } catch (const std::invalid_argument& error) {
            throw UsageError("--etcd " + request.location + ": " + error.what());
        }
        return std::move(request);
    }

private:
    // First of all: a password may hold commas, and nothing of it is to be shown.
    void refuseUsersInUrls() const {
        const bool hasUser = std::any_of(parts.begin(), parts.end(), [](const auto& part) {
            return findSetting(nameOf(part)) == nullptr && part.find('@') != std::string::npos;
        });
        if (!hasUser) return;
        throw UsageError(
            "--etcd: a URL takes no user and no password; user=NAME and password-file=FILE name "
            "them");
    }

    void collectUrls() {
        auto& endpoints = request.etcd->endpoints;
        std::copy_if(parts.begin(), parts.end(), std::back_inserter(endpoints), isUrl);
        if (endpoints.empty()) {
            throw UsageError(
                "--etcd: a URL is needed, such as http://HOST:PORT or https://HOST:PORT");
        }
        request.location = endpoints.front();
    }

    void readSetting(const std::string& part) {
        const std::string name(nameOf(part));
        const Setting* const setting = findSetting(name);
        if (setting == nullptr) {
            throw std::invalid_argument("unknown setting: " + name + " (see --help)");
        }
        if (!given.insert(name).second) throw std::invalid_argument(name + " is given twice");
        const bool hasValue = name.size() != part.size();
        if (hasValue && setting->value.empty()) {
            throw std::invalid_argument(name + " takes no value");
        }
        const std::string value = hasValue ? part.substr(name.size() + 1) : "";
        const bool isMissing = !hasValue || (value.empty() && !setting->mayBeEmpty);
        if (isMissing && !setting->value.empty()) {
            throw std::invalid_argument(name + '=' + std::string(setting->value) + " is needed");
        }
        setting->apply(request, value);
    }

    bool has(const std::string& name) const { return given.count(name) != 0; }

    // Whoever has values kept wants them.
    void completeStart() {
        if (has("last-known") && !has("without-server")) {
            request.etcd->options.withoutServer = StartWithoutServer::lastKnown;
        }
    }

    // What would be without effect, or fail later.
    void refuseHalves() const {
        requireWith("without-server=last-known", "last-known=FILE",
                    request.etcd->options.withoutServer != StartWithoutServer::lastKnown ||
                        has("last-known"));
        requireWith("user=NAME", "password-file=FILE", !has("user") || has("password-file"));
        requireWith("password-file=FILE", "user=NAME", !has("password-file") || has("user"));
        requireWith("cert=FILE", "key=FILE", !has("cert") || has("key"));
        requireWith("key=FILE", "cert=FILE", !has("key") || has("cert"));
        const auto& urls = request.etcd->endpoints;
        const bool isSecure = std::any_of(urls.begin(), urls.end(), isSecureUrl);
        requireWith("ca=FILE", "an https URL", !has("ca") || isSecure);
        requireWith("cert=FILE", "an https URL", !has("cert") || isSecure);
        requireWith("compare-and-swap", "writable", !has("compare-and-swap") || request.writable);
    }

    static void requireWith(const std::string& one, const std::string& other, bool isFine) {
        if (!isFine) throw std::invalid_argument(one + " needs " + other);
    }

    const std::vector<std::string> parts;
    SourceRequest request;
    std::set<std::string> given;
};

}  // namespace

SourceRequest parseEtcd(const std::string& text) {
    return Reader(text).read();
}

}  // namespace velkor::host
