// What the store costs over HTTP: beside a bare handler of the library beneath it, with many event
// streams, beside slow clients, and for a million requests. Prints a table; ends within two
// minutes.
//
//     bench-http            in full
//     bench-http --short    each of it once, with few requests

#include <sys/resource.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include "benchmarks/http/LoadClient.hpp"
#include "benchmarks/http/ServerProcess.hpp"
#include "benchmarks/http/StreamClients.hpp"

namespace velkor::benchmarks {
namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;

constexpr std::size_t connectionCount = 16;

std::string post(const std::string& type, const std::string& body) {
    return "POST /velkor/configuration/" + type +
           " HTTP/1.1\r\nHost: localhost\r\nContent-Type: application/json\r\nContent-Length: " +
           std::to_string(body.size()) + "\r\n\r\n" + body;
}

const std::string get = post("ConfigurationGet", R"({"key":"server.port"})");

std::string set(int value) {
    return post("ConfigurationSet", R"({"key":"server.port","value":{"type":"int","value":)" +
                                        std::to_string(value) + "}}");
}

// Has one request answered.
void ask(const ServerProcess& server, const std::string& request) {
    LoadClient(server.port(), 0, request);
}

struct Speed {
    double rate = 0;           // requests a second
    double processorTime = 1;  // of the server, seconds a request
};

Speed measure(const ServerProcess& server, std::size_t requests) {
    LoadClient client(server.port(), connectionCount, get);
    const double before = server.processorSeconds();
    const LoadClient::Result result = client.run(requests, seconds(10));
    const auto answered = static_cast<double>(result.latencies.size());
    return {answered / result.seconds, (server.processorSeconds() - before) / answered};
}

// The rates of both, in turns, so that what else the machine does meets both; the best of each.
void compareRates(std::size_t rounds, std::size_t requests) {
    const ServerProcess store(serveStore);
    ask(store, set(9090));
    const ServerProcess bare([](const auto& tellPort, const auto& awaitEnd) {
        serveConstant(
            R"({"key":"server.port","source":"override","value":{"type":"int","value":9090}})",
            tellPort, awaitEnd);
    });
    Speed ofBare;
    Speed ofStore;
    const auto keepBest = [](Speed& best, const Speed& now) {
        best.rate = std::max(best.rate, now.rate);
        best.processorTime = std::min(best.processorTime, now.processorTime);
    };
    for (std::size_t round = 0; round < rounds; ++round) {
        keepBest(ofBare, measure(bare, requests));
        keepBest(ofStore, measure(store, requests));
    }
    std::printf("%-46s %10s %14s\n", "constant and ConfigurationGet, 16 connections", "requests/s",
                "processor us");
    std::printf("%-46s %10.0f %14.2f\n", "  bare handler", ofBare.rate, ofBare.processorTime * 1e6);
    std::printf("%-46s %10.0f %14.2f\n", "  store", ofStore.rate, ofStore.processorTime * 1e6);
    std::printf("%-46s %10.2f %14.2f\n", "  ratio (goal: rate at least 0.85)",
                ofStore.rate / ofBare.rate, ofBare.processorTime / ofStore.processorTime);
}

void followStreams(std::size_t count, int writes) {
    const ServerProcess server(serveStore);
    ask(server, set(1));
    { const StreamClients first(server.port(), 10, "/watch?key=server.port"); }
    const double before = server.residentBytes();
    StreamClients streams(server.port(), count, "/watch?key=server.port");
    const double each = (server.residentBytes() - before) / static_cast<double>(count);
    const auto begin = Clock::now();
    ask(server, set(2));
    const std::vector<double> times = streams.awaitText("\"value\":2}", begin, seconds(10));
    for (int value = 3; value < 3 + writes; ++value) ask(server, set(value));
    const std::string last = "\"value\":" + std::to_string(2 + writes) + "}";
    const std::size_t onLast = streams.awaitText(last, Clock::now(), seconds(20)).size();
    std::printf("\n%zu watch streams\n", count);
    std::printf("  memory each (goal: at most 5 KB)             %10.1f KB\n", each / 1024);
    std::printf("  one write reached                            %10zu\n", times.size());
    std::printf("  until the last has it, median / worst        %7.1f / %.1f ms\n",
                quantile(times, 0.5) * 1e3, quantile(times, 1) * 1e3);
    std::printf("  end on the last of %4d writes               %10zu\n", writes, onLast);
}

// Connections that send a request byte by byte, each one byte every 100 ms, in turn, and then the
// next request.
class SlowClients {
public:
    SlowClients(const ServerProcess& server, std::size_t count)
        : sockets(count), begin(Clock::now()) {
        for (int& socket : sockets) socket = connectTo(server.port());
    }
    ~SlowClients() {
        for (const int socket : sockets) ::close(socket);
    }

    SlowClients(const SlowClients&) = delete;
    SlowClients& operator=(const SlowClients&) = delete;

    // Sends what is due.
    void goOn() {
        const auto interval = milliseconds(100) / sockets.size();
        while (begin + interval * sent < Clock::now()) {
            const char byte = get[sent / sockets.size() % get.size()];
            ::send(sockets[sent % sockets.size()], &byte, 1, MSG_NOSIGNAL);
            ++sent;
        }
    }

private:
    std::vector<int> sockets;
    Clock::time_point begin;
    std::size_t sent = 0;
};

void standSlowClients(std::size_t rounds, std::size_t requests) {
    const ServerProcess server(serveStore);
    ask(server, set(9090));
    LoadClient honest(server.port(), 4, get);
    double without = 1;
    double with = 1;
    std::size_t served = 0;
    for (std::size_t round = 0; round < rounds; ++round) {
        const auto undisturbed = honest.run(requests, seconds(10));
        SlowClients slow(server, 100);
        const auto disturbed = honest.run(requests, seconds(10), [&] { slow.goOn(); });
        served += disturbed.latencies.size();
        without = std::min(without, quantile(undisturbed.latencies, 0.99));
        with = std::min(with, quantile(disturbed.latencies, 0.99));
    }
    std::printf("\n100 slow clients\n");
    std::printf("  honest requests served                       %10zu of %zu\n", served,
                rounds * requests);
    std::printf("  p99 without / with                           %7.3f / %.3f ms\n", without * 1e3,
                with * 1e3);
    std::printf("  ratio (goal: at most 3)                      %10.2f\n", with / without);
}

void soak(std::size_t requests) {
    const ServerProcess server(serveStore);
    ask(server, set(9090));
    LoadClient client(server.port(), connectionCount, get);
    std::size_t served = client.run(requests / 10, seconds(10)).latencies.size();
    const double atFirst = server.residentBytes();
    served += client.run(requests - requests / 10, seconds(90)).latencies.size();
    const double atLast = server.residentBytes();
    std::printf("\n%zu requests\n", requests);
    std::printf("  served                                       %10zu\n", served);
    std::printf("  memory after a tenth / all                   %7.0f / %.0f KB\n", atFirst / 1024,
                atLast / 1024);
}

// A thousand clients need two thousand descriptors.
void allowDescriptors() {
    rlimit limit{};
    ::getrlimit(RLIMIT_NOFILE, &limit);
    limit.rlim_cur = std::min<rlim_t>(limit.rlim_max, 8192);
    ::setrlimit(RLIMIT_NOFILE, &limit);
}

}  // namespace
}  // namespace velkor::benchmarks

int main(int count, char** words) {
    using namespace velkor::benchmarks;
    const bool isShort = count > 1 && std::string_view(words[1]) == "--short";
    allowDescriptors();
    compareRates(isShort ? 1 : 5, isShort ? 1'000 : 60'000);
    followStreams(isShort ? 50 : 1'000, isShort ? 20 : 200);
    standSlowClients(isShort ? 1 : 9, isShort ? 1'000 : 20'000);
    soak(isShort ? 1'000 : 1'000'000);
    return 0;
}
