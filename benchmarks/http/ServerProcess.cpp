#include "benchmarks/http/ServerProcess.hpp"

#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace velkor::benchmarks {

ServerProcess::ServerProcess(const Serve& serve) {
    std::array<int, 2> life{};
    std::array<int, 2> news{};
    if (::pipe(life.data()) != 0 || ::pipe(news.data()) != 0) throw std::runtime_error("no pipe");
    process = ::fork();
    if (process == 0) {
        ::close(life[1]);
        ::close(news[0]);
        serve(
            [&](std::uint16_t port) {
                if (::write(news[1], &port, sizeof port) != sizeof port) std::_Exit(1);
            },
            [&] {
                char byte = 0;
                while (::read(life[0], &byte, 1) > 0) continue;
            });
        std::_Exit(0);
    }
    ::close(life[0]);
    ::close(news[1]);
    lifeLine = life[1];
    const bool told = ::read(news[0], &toldPort, sizeof toldPort) == sizeof toldPort;
    ::close(news[0]);
    if (!told) throw std::runtime_error("the server does not start");
}

ServerProcess::~ServerProcess() {
    ::close(lifeLine);
    ::waitpid(process, nullptr, 0);
}

double ServerProcess::residentBytes() const {
    std::ifstream status("/proc/" + std::to_string(process) + "/status");
    for (std::string line; std::getline(status, line);) {
        if (line.rfind("VmRSS:", 0) == 0) return std::stod(line.substr(6)) * 1024;
    }
    return 0;
}

double ServerProcess::processorSeconds() const {
    std::ifstream file("/proc/" + std::to_string(process) + "/stat");
    std::string text;
    std::getline(file, text);
    std::istringstream fields(text.substr(text.rfind(')') + 2));
    std::string field;
    for (int i = 0; i < 11; ++i) fields >> field;  // up to the user's time
    double user = 0;
    double system = 0;
    fields >> user >> system;
    return (user + system) / static_cast<double>(::sysconf(_SC_CLK_TCK));
}

}  // namespace velkor::benchmarks
