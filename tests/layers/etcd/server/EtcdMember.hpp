#pragma once

#include <arpa/inet.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <random>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/BoundedWait.hpp"

namespace velkor::testing {

/// Waits for what nobody tells of, and says whether it came about.
template <class Condition>
[[nodiscard]] bool comesAbout(Condition condition) {
    const auto end = std::chrono::steady_clock::now() + 2 * patience;
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end) return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    return true;
}

/// Whether the calling program is the only one that has claimed this port, which is its own then
/// until it ends: a server that was given a port has it a while later only.
inline bool claims(int port) {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    // A name without a file, which begins with a zero.
    const std::string name = "velkor-test-port-" + std::to_string(port);
    name.copy(address.sun_path + 1, sizeof address.sun_path - 1);
    const int claim = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const auto size = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + 1 + name.size());
    if (::bind(claim, reinterpret_cast<sockaddr*>(&address), size) == 0) return true;
    ::close(claim);
    return false;
}

/// A port of the loopback interface that nobody uses now, that no other test is given, and that the
/// system gives nobody who asks for any.
inline int freePort() {
    static std::random_device random;
    for (;;) {
        const int port = std::uniform_int_distribution<>(20'000, 32'000)(random);
        if (!claims(port)) continue;
        const int socket = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_port = htons(static_cast<std::uint16_t>(port));
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        const bool isFree =
            ::bind(socket, reinterpret_cast<sockaddr*>(&address), sizeof address) == 0;
        ::close(socket);
        if (isFree) return port;
    }
}

/// A folder of its own, in memory where the system has that; gone with this.
class ServerFolder {
public:
    ServerFolder() {
        const bool hasMemory = std::filesystem::is_directory("/dev/shm");
        const std::filesystem::path parent =
            hasMemory ? "/dev/shm" : std::filesystem::temp_directory_path();
        std::string name = (parent / "velkor-etcd-XXXXXX").string();
        if (::mkdtemp(name.data()) == nullptr) throw std::runtime_error("can't create " + name);
        folder = name;
    }
    ~ServerFolder() {
        std::error_code leftBehind;
        std::filesystem::remove_all(folder, leftBehind);
    }
    ServerFolder(const ServerFolder&) = delete;
    ServerFolder& operator=(const ServerFolder&) = delete;

    const std::filesystem::path& path() const { return folder; }

private:
    std::filesystem::path folder;
};

/// What a command prints, errors too. Throws with that when it fails.
inline std::string outputOf(const std::string& command) {
    FILE* const pipe = ::popen((command + " 2>&1").c_str(), "r");
    if (pipe == nullptr) throw std::runtime_error("can't run " + command);
    std::string output;
    std::array<char, 4096> part{};
    for (std::size_t size; (size = ::fread(part.data(), 1, part.size(), pipe)) > 0;) {
        output.append(part.data(), size);
    }
    if (::pclose(pipe) != 0) throw std::runtime_error(command + ": " + output);
    return output;
}

inline std::string quoted(const std::string& text) {
    return "'" + text + "'";
}

/// A process of the engine, a member of a cluster. Ends with this, and with the test program.
class EtcdMember {
public:
    EtcdMember(std::string memberName, int clients, int peers, std::string wholeCluster,
               std::vector<std::string> moreArguments = {})
        : name(std::move(memberName)),
          clientPort(clients),
          peerPort(peers),
          cluster(std::move(wholeCluster)),
          arguments(std::move(moreArguments)) {}

    ~EtcdMember() { kill(); }

    EtcdMember(const EtcdMember&) = delete;
    EtcdMember& operator=(const EtcdMember&) = delete;

    /// Starts the process on the data that there is.
    void start() {
        std::vector<std::string> all{"etcd",
                                     "--name=" + name,
                                     "--data-dir=" + data().string(),
                                     "--listen-client-urls=" + scheme + local(clientPort),
                                     "--advertise-client-urls=" + scheme + local(clientPort),
                                     "--listen-peer-urls=http://" + local(peerPort),
                                     "--initial-advertise-peer-urls=http://" + local(peerPort),
                                     "--initial-cluster=" + cluster,
                                     "--log-level=error",
                                     "--logger=zap"};
        all.insert(all.end(), arguments.begin(), arguments.end());
        std::vector<char*> raw;
        for (auto& each : all) raw.push_back(each.data());
        raw.push_back(nullptr);
        const std::string log = (folder.path() / "log").string();
        const pid_t parent = ::getpid();
        process = ::fork();
        if (process != 0) return;
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        if (::getppid() != parent) ::_exit(1);
        const int output = ::open(log.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
        ::dup2(output, 1);
        ::dup2(output, 2);
        ::execvp("etcd", raw.data());
        ::_exit(127);
    }

    void kill() {
        if (process <= 0) return;
        ::kill(process, SIGKILL);
        ::waitpid(process, nullptr, 0);
        process = 0;
    }

    /// Whatever became of the process, it runs afterwards.
    void revive() {
        if (process <= 0) start();
        thaw();
        if (!comesAbout([this] { return answers(); })) {
            throw std::runtime_error("etcd doesn't start: " + report());
        }
    }

    void freeze() const { ::kill(process, SIGSTOP); }
    void thaw() const { ::kill(process, SIGCONT); }

    /// Clients come over TLS.
    void useTls() { scheme = "https://"; }

    std::string url() const { return scheme + local(clientPort); }
    int port() const { return clientPort; }
    std::filesystem::path data() const { return folder.path() / "data"; }
    const std::filesystem::path& place() const { return folder.path(); }
    std::string peer() const { return name + "=http://" + local(peerPort); }

    /// What etcdctl prints, asked this member.
    std::string ctl(const std::string& command) const {
        return outputOf("ETCDCTL_API=3 etcdctl --command-timeout=20s --endpoints=" + url() + " " +
                        options + " " + command);
    }

    /// What the process has said, and what it says of itself now.
    std::string report() const {
        std::ifstream log(folder.path() / "log");
        std::string text{std::istreambuf_iterator<char>(log), {}};
        try {
            text += ctl("--command-timeout=2s endpoint status -w fields");
        } catch (const std::runtime_error& error) {
            text += error.what();
        }
        return name + " at " + url() + ":\n" + text + '\n';
    }

    /// For each call of etcdctl from now on.
    void ctlOptions(const std::string& more) { options = more; }

    bool answers() const {
        try {
            ctl("--command-timeout=2s get velkor-test-nothing");
            return true;
        } catch (const std::runtime_error&) {
            return false;
        }
    }

    bool leads() const {
        try {
            const std::string status = ctl("--command-timeout=2s endpoint status -w fields");
            const auto idOf = [&](const std::string& field) {
                const auto begin = status.find("\"" + field + "\" : ");
                return status.substr(begin, status.find('\n', begin) - begin)
                    .substr(field.size() + 5);
            };
            return idOf("MemberID") == idOf("Leader");
        } catch (const std::exception&) {
            return false;
        }
    }

private:
    static std::string local(int port) { return "127.0.0.1:" + std::to_string(port); }

    const std::string name;
    const int clientPort;
    const int peerPort;
    const std::string cluster;
    const std::vector<std::string> arguments;
    std::string scheme = "http://";
    std::string options;
    ServerFolder folder;
    pid_t process = 0;
};

/// As many members that form a cluster.
class EtcdCluster {
public:
    explicit EtcdCluster(int count = 1, const std::vector<std::string>& arguments = {}) {
        std::vector<int> ports;
        std::string all;
        for (int i = 0; i < count; ++i) {
            ports.push_back(freePort());
            all += (i > 0 ? ",m" : "m") + std::to_string(i) +
                   "=http://127.0.0.1:" + std::to_string(ports.back());
        }
        for (int i = 0; i < count; ++i) {
            members.push_back(std::make_unique<EtcdMember>("m" + std::to_string(i), freePort(),
                                                           ports[static_cast<std::size_t>(i)], all,
                                                           arguments));
            members.back()->start();
        }
        for (const auto& member : members) member->revive();
    }

    EtcdMember& operator[](std::size_t index) { return *members[index]; }
    std::size_t size() const { return members.size(); }

    std::vector<std::string> urls() const {
        std::vector<std::string> all;
        for (const auto& member : members) all.push_back(member->url());
        return all;
    }

    /// The place of the member that leads the others.
    std::size_t leader() {
        std::size_t found = 0;
        const bool hasOne = comesAbout([&] {
            for (found = 0; found < size(); ++found) {
                if (members[found]->leads()) return true;
            }
            return false;
        });
        if (!hasOne) throw std::runtime_error("nobody leads");
        return found;
    }

private:
    std::vector<std::unique_ptr<EtcdMember>> members;
};

}  // namespace velkor::testing
