#include "benchmarks/fleet/WatchProcess.hpp"

#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <charconv>
#include <stdexcept>

#include "benchmarks/fleet/Host.hpp"

namespace velkor::benchmarks {

namespace {

// The number after `lead` in `text`; `otherwise` when there is none.
int numberAfter(std::string_view lead, std::string_view text, int otherwise) {
    const std::size_t begin = text.find(lead);
    if (begin == std::string_view::npos) return otherwise;
    const char* const first = text.data() + begin + lead.size();
    int number = otherwise;
    std::from_chars(first, text.data() + text.size(), number);
    return number;
}

}  // namespace

int settingOf(std::string_view engineKey) {
    return numberAfter(std::string(fleetPrefix) + "setting.", engineKey, -1);
}

int numberIn(std::string_view engineValue) {
    return numberAfter(R"("value":)", engineValue, 0);
}

WatchProcess::WatchProcess(const std::vector<std::string>& endpoints) {
    std::array<int, 2> pipe{};
    if (::pipe2(pipe.data(), O_CLOEXEC) != 0) throw std::runtime_error("no pipe");
    start(endpoints, pipe[1]);
    ::close(pipe[1]);
    input = pipe[0];
    thread = std::thread([this] { read(); });
}

WatchProcess::~WatchProcess() {
    if (process > 0) {
        ::kill(process, SIGKILL);
        ::waitpid(process, nullptr, 0);
    }
    thread.join();
    ::close(input);
}

void WatchProcess::start(const std::vector<std::string>& endpoints, int output) {
    std::string all = "--endpoints=";
    for (const auto& each : endpoints) all += (&each == &endpoints.front() ? "" : ",") + each;
    std::vector<std::string> words{"etcdctl", "watch", "--prefix", "--rev=1", all, fleetPrefix};
    std::vector<char*> raw;
    for (auto& each : words) raw.push_back(each.data());
    raw.push_back(nullptr);
    const pid_t parent = ::getpid();
    process = ::fork();
    if (process != 0) return;
    ::prctl(PR_SET_PDEATHSIG, SIGKILL);
    if (::getppid() != parent) ::_exit(1);
    const int nowhere = ::open("/dev/null", O_RDWR);
    ::dup2(nowhere, 0);
    ::dup2(output, 1);
    ::dup2(nowhere, 2);
    ::execvp("etcdctl", raw.data());
    ::_exit(127);
}

void WatchProcess::read() {
    std::array<char, 65536> part{};
    std::string lines;
    for (ssize_t size; (size = ::read(input, part.data(), part.size())) > 0;) {
        lines.append(part.data(), static_cast<std::size_t>(size));
        std::size_t begin = 0;
        for (std::size_t end; (end = lines.find('\n', begin)) != std::string::npos;
             begin = end + 1) {
            onLine(std::string_view(lines).substr(begin, end - begin));
        }
        lines.erase(0, begin);
    }
}

// "PUT", the key and the value.
void WatchProcess::onLine(std::string_view line) {
    const int which = place;
    place = (place + 1) % 3;
    if (which == 1) key = settingOf(line);
    if (which != 2) return;
    const std::lock_guard<std::mutex> lock(mutex);
    changes.push_back({FleetClock::now(), key, numberIn(line)});
}

std::vector<Seen> WatchProcess::seen() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return changes;
}

}  // namespace velkor::benchmarks
