#include "benchmarks/fleet/Host.hpp"

#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <chrono>
#include <utility>

#include "benchmarks/fleet/Commands.hpp"

namespace velkor::benchmarks {

using layers::EtcdSource;
using layers::UnknownOutcome;
using std::chrono::milliseconds;

namespace {

layers::EtcdOptions patientStart() {
    layers::EtcdOptions options;
    options.startWithin = std::chrono::seconds(60);  // all start at once
    return options;
}

int pollTime(FleetClock::time_point due) {
    if (due == FleetClock::time_point::max()) return -1;
    const auto left = std::chrono::ceil<milliseconds>(due - FleetClock::now());
    return std::max(0, static_cast<int>(left.count()));
}

}  // namespace

std::string settingName(int key) {
    return "setting." + std::to_string(key);
}

Host::Host(int ownNumber, const FleetOptions& how, const std::vector<std::string>& endpoints,
           Journal& notes)
    : number(ownNumber),
      options(how),
      journal(notes),
      source(EtcdSource::open(endpoints, fleetPrefix, patientStart())),
      random(how.seed + static_cast<unsigned>(ownNumber)) {
    store->addSource("fleet", "", -1, false, source).get();
    for (int key = 0; key < options.settings; ++key) follow(key);
}

void Host::follow(int key) {
    settings.push_back(std::make_unique<Setting>(store, settingName(key), 0));
    Setting& setting = *settings.back();
    following.push_back(setting.onChange([this, key, &setting](int /*before*/, int /*now*/) {
        journal.add(What::shown, key, setting.get());
    }));
}

void Host::serve(int socket) {
    for (;;) {
        pollfd polled{socket, POLLIN, 0};
        if (::poll(&polled, 1, pollTime(writeDue)) > 0) {
            char command = commands::end;
            if (::recv(socket, &command, 1, 0) <= 0 || !carryOut(command, socket)) return;
        }
        if (FleetClock::now() >= writeDue) write();
    }
}

// Gives whether it goes on.
bool Host::carryOut(char command, int socket) {
    switch (command) {
        case commands::fill:
            fill();
            break;
        case commands::beginWriting:
            if (number < options.writers) writeDue = nextWrite();
            break;
        case commands::endWriting:
            writeDue = FleetClock::time_point::max();
            break;
        case commands::tellValues:
            tellValues(socket);
            return true;
        default:
            return false;
    }
    return ::send(socket, &command, 1, MSG_NOSIGNAL) == 1;
}

void Host::fill() {
    for (int key = 0; key < options.settings; ++key) write(key);
}

// As many writes a second on average, at random times.
FleetClock::time_point Host::nextWrite() {
    const double mean = options.writers / options.rate;
    const std::chrono::duration<double> pause(
        std::uniform_real_distribution<double>(0, 2 * mean)(random));
    return FleetClock::now() + std::chrono::duration_cast<FleetClock::duration>(pause);
}

void Host::write() {
    write(std::uniform_int_distribution<int>(0, options.settings - 1)(random));
    writeDue = nextWrite();
}

void Host::write(int key) {
    const int value = (number + 1) * writesOfEach + ++written;
    const std::string name = settingName(key);
    journal.add(What::sent, key, value);
    store->set(name, value);
    const int present = boost::get<int>(store->get(name).get());
    What outcome = What::taken;
    try {
        source->committed().get();
    } catch (const UnknownOutcome&) {
        outcome = What::unknown;
    } catch (const std::runtime_error&) {
        outcome = What::refused;
    }
    journal.add(outcome, key, value);
    if (outcome == What::taken && present != value) journal.add(What::readBack, key, present);
}

void Host::tellValues(int socket) const {
    std::vector<int> values;
    for (const auto& setting : settings) values.push_back(setting->get());
    ::send(socket, values.data(), values.size() * sizeof(int), MSG_NOSIGNAL);
}

}  // namespace velkor::benchmarks
