#include "http/detail/routes/Health.hpp"

#include <array>
#include <utility>

#include "configuration/sources/SourceDescription.hpp"
#include "http/detail/routes/Layers.hpp"

namespace velkor::http::detail {

namespace {

using configuration::SourceDescription;

Response plainText(int status, std::string&& text) {
    return {status, "text/plain; charset=utf-8", std::move(text), {}};
}

bool isWell(const SourceDescription& layer) {
    return !layer.state || layer.state->isWell;
}

// The layers, with 1 for those that are well.
void writeLayers(const Context& context, std::string& out) {
    std::string states;
    const auto layers = context.store->describeSources().get();
    for (const auto& layer : layers) {
        states.append("velkor_layer_well{layer=\"").append(labelText(layer.name)).append("\"} ");
        states.append(isWell(layer) ? "1\n" : "0\n");
    }
    writeMetric(out, "velkor_layers", "gauge", "Layers of the store.", layers.size());
    writeMetricHead(out, "velkor_layer_well", "gauge", "Whether a layer is well.");
    out.append(states);
}

struct TransportMetric {
    const char* name;
    const char* type;
    const char* help;
    TransportCounts::Count TransportCounts::*count;
};

constexpr std::array<TransportMetric, 13> transportMetrics{{
    {"velkor_http_connections", "gauge", "Open connections.", &TransportCounts::connectionsOpen},
    {"velkor_http_connections_accepted_total", "counter", "Connections that were opened.",
     &TransportCounts::connectionsAccepted},
    {"velkor_http_connections_refused_total", "counter", "Connections that were one too many.",
     &TransportCounts::connectionsRefused},
    {"velkor_http_streams", "gauge", "Open event streams.", &TransportCounts::streamsOpen},
    {"velkor_http_streams_refused_total", "counter", "Event streams that were one too many.",
     &TransportCounts::streamsRefused},
    {"velkor_http_events_written_total", "counter", "Events that were sent to clients.",
     &TransportCounts::eventsWritten},
    {"velkor_http_requests_read_total", "counter", "Requests that were read.",
     &TransportCounts::requestsRead},
    {"velkor_http_requests_refused_total", "counter", "Requests that were no HTTP or too large.",
     &TransportCounts::requestsRefused},
    {"velkor_http_answers_refused_total", "counter",
     "Requests that there was no room for, be it for their bodies or answers.",
     &TransportCounts::answersRefused},
    {"velkor_http_requests_timed_out_total", "counter", "Requests that were not complete in time.",
     &TransportCounts::requestsTimedOut},
    {"velkor_http_writes_timed_out_total", "counter",
     "Answers and events that were not taken in time.", &TransportCounts::writesTimedOut},
    {"velkor_http_read_bytes_total", "counter", "Bytes that were read.",
     &TransportCounts::bytesRead},
    {"velkor_http_written_bytes_total", "counter", "Bytes that were written.",
     &TransportCounts::bytesWritten},
}};

void writeTransport(const TransportCounts& counts, std::string& out) {
    for (const TransportMetric& each : transportMetrics) {
        writeMetric(out, each.name, each.type, each.help, counts.*each.count);
    }
}

void writeValues(const Metrics& metrics, std::string& out) {
    writeMetricHead(out, "velkor_http_watches", "gauge", "Open watches, by what is watched.");
    out.append("velkor_http_watches{of=\"key\"} ").append(std::to_string(metrics.watchesOpen));
    out.append("\nvelkor_http_watches{of=\"prefix\"} ");
    out.append(std::to_string(metrics.changeStreamsOpen)).append("\n");
    writeMetric(out, "velkor_http_values_delivered_total", "counter",
                "Values that were shown to watches.", metrics.valuesDelivered);
    writeMetric(out, "velkor_http_values_conflated_total", "counter",
                "Values of watched keys that newer ones replaced before they were shown.",
                metrics.valuesConflated);
}

}  // namespace

Response alive(const Context&, const Call&) {
    return plainText(200, "alive\n");
}

Response ready(const Context& context, const Call& call) {
    std::string names;
    for (const auto& layer : context.store->describeSources().get()) {
        if (!isWell(layer)) names += (names.empty() ? "" : ", ") + layer.name;
    }
    if (names.empty()) return plainText(200, "ready\n");
    const bool mayKnow = call.visitor.right >= Right::read;
    Response response = plainText(503, mayKnow ? "not ready: " + names + "\n" : "not ready\n");
    response.headers.emplace_back("Retry-After", "1");
    return response;
}

Response metricsText(const Context& context, const Call&) {
    std::string text;
    writeMetric(text, "velkor_keys", "gauge", "Keys of the store.",
                context.keys.of(*context.store)->size());
    writeLayers(context, text);
    context.metrics->writeRequests(text);
    writeValues(*context.metrics, text);
    writeTransport(*context.transport, text);
    return {200, "text/plain; version=0.0.4; charset=utf-8", std::move(text), {}};
}

}  // namespace velkor::http::detail
