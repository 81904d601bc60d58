#include "benchmarks/fleet/HostProcess.hpp"

#include <dirent.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>
#include <boost/log/core/core.hpp>

#include <algorithm>
#include <array>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <set>
#include <sstream>
#include <stdexcept>

#include "benchmarks/fleet/Commands.hpp"
#include "benchmarks/fleet/Host.hpp"
#include "benchmarks/fleet/Interruption.hpp"

namespace velkor::benchmarks {

namespace {

// A process shows each write once, writers note three things of each, and what is written while
// time runs out or members start is more than what was asked for.
std::size_t mostNotes(const FleetOptions& options) {
    const double writes = options.rate * (options.quiet + options.seconds) + options.settings;
    return static_cast<std::size_t>(8 * writes) + 10'000;
}

std::string pathOf(pid_t process, const char* file) {
    return "/proc/" + std::to_string(process) + "/" + file;
}

// "socket:[4711]" for each of its sockets.
std::set<std::string> socketsOf(pid_t process) {
    std::set<std::string> sockets;
    const std::string folder = pathOf(process, "fd");
    DIR* const descriptors = ::opendir(folder.c_str());
    if (descriptors == nullptr) return sockets;
    while (const dirent* each = ::readdir(descriptors)) {
        std::array<char, PATH_MAX> target{};
        const auto size =
            ::readlink((folder + "/" + each->d_name).c_str(), target.data(), target.size());
        if (size > 0) sockets.emplace(target.data(), static_cast<std::size_t>(size));
    }
    ::closedir(descriptors);
    return sockets;
}

}  // namespace

HostProcess::HostProcess(int number, const FleetOptions& options,
                         const std::vector<std::string>& endpoints)
    : ownNumber(number),
      settings(static_cast<std::size_t>(options.settings)),
      journal(mostNotes(options)) {
    std::array<int, 2> sockets{};
    if (::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, sockets.data()) != 0) {
        throw std::runtime_error("no socket for a process");
    }
    socket = sockets[0];
    otherSocket = sockets[1];
    const pid_t parent = ::getpid();
    process = ::fork();
    if (process == 0) {
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        if (::getppid() != parent) ::_exit(1);
        run(options, endpoints);
    }
    ::close(otherSocket);
    if (process < 0) throw std::runtime_error("no process");
}

HostProcess::~HostProcess() {
    if (process > 0) ::kill(process, SIGKILL);
    await();
    ::close(socket);
}

void HostProcess::run(const FleetOptions& options, const std::vector<std::string>& endpoints) {
    ::close(socket);
    Interruption::ignore();
    boost::log::core::get()->set_logging_enabled(false);
    try {
        Host host(ownNumber, options, endpoints, journal);
        ::send(otherSocket, &commands::ready, 1, MSG_NOSIGNAL);
        host.serve(otherSocket);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "process %d: %s\n", ownNumber, error.what());
        std::_Exit(1);
    }
    std::_Exit(0);
}

void HostProcess::receive(void* target, std::size_t size) const {
    for (std::size_t received = 0; received < size;) {
        const auto more = ::recv(socket, static_cast<char*>(target) + received, size - received, 0);
        Interruption::check();
        if (more <= 0)
            throw std::runtime_error("process " + std::to_string(ownNumber) + " has ended");
        received += static_cast<std::size_t>(more);
    }
}

void HostProcess::awaitReady() const {
    awaitDone(commands::ready);
}

void HostProcess::tell(char command) const {
    static_cast<void>(!::send(socket, &command, 1, MSG_NOSIGNAL));  // no answer tells of the end
}

void HostProcess::awaitDone(char command) const {
    char answer = 0;
    receive(&answer, 1);
    if (answer != command) throw std::logic_error("another command was carried out");
}

std::vector<int> HostProcess::values() const {
    std::vector<int> all(settings);
    tell(commands::tellValues);
    receive(all.data(), all.size() * sizeof(int));
    return all;
}

int HostProcess::connections() const {
    const auto sockets = socketsOf(process);
    std::ifstream table("/proc/net/tcp");
    int count = 0;
    for (std::string line; std::getline(table, line);) {
        std::istringstream fields(line);
        std::array<std::string, 10> field{};
        for (auto& each : field) fields >> each;
        const bool isEstablished = field[3] == "01";
        if (isEstablished && sockets.count("socket:[" + field[9] + "]") > 0) ++count;
    }
    return count;
}

double HostProcess::ownBytes() const {
    std::ifstream file(pathOf(process, "status"));
    for (std::string line; std::getline(file, line);) {
        if (line.rfind("RssAnon:", 0) == 0) return std::stod(line.substr(8)) * 1024;
    }
    return 0;
}

int HostProcess::await() {
    int status = 0;
    if (process > 0) ::waitpid(process, &status, 0);
    process = 0;
    return status;
}

bool HostProcess::end() {
    tell(commands::end);
    return await() == 0;
}

}  // namespace velkor::benchmarks
