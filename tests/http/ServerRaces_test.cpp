// Whole servers, with their threads and sockets, beside what else is done to the store.

#include <gtest/gtest.h>

#include <atomic>
#include <exception>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "http/Server.hpp"
#include "settings/Setting.hpp"
#include "tests/http/transport/HttpClient.hpp"

namespace velkor::http {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using settings::Setting;
using velkor::testing::HttpAnswer;
using velkor::testing::HttpClient;

class ServerRaces : public ::testing::Test {
protected:
    ServerRaces() {
        options.threads = 2;
        options.allowWrites = true;
    }

    static HttpAnswer patch(HttpClient& client, const std::string& body) {
        client.send("PATCH /config HTTP/1.1\r\nHost: localhost\r\nContent-Length: " +
                    std::to_string(body.size()) + "\r\n\r\n" + body);
        return client.answer();
    }

    void setBoth(int value) const {
        store->apply(
            {{"pair.a", ConfigurationValue(value)}, {"pair.b", ConfigurationValue(value)}});
    }

    static std::string item(const std::string& key, const std::string& value) {
        return "{\"key\":\"" + key + R"(","value":{"type":"int","value":)" + value +
               R"(},"source":"override"})";
    }

    const std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    ServerOptions options;
};

TEST_F(ServerRaces, NoPageShowsHalfOfAChange) {
    constexpr int pages = 100;
    const Server server(store, options);
    setBoth(0);
    std::atomic<bool> done{false};
    std::thread writer([&] {
        for (int i = 0; !done; ++i) setBoth(i);
    });
    std::thread patcher([&] {
        HttpClient client(server.port());
        while (!done) {
            const std::string value = R"("value":{"type":"int","value":-1}})";
            const auto answer = patch(client, R"({"changes":[{"key":"pair.a",)" + value +
                                                  R"(,{"key":"pair.b",)" + value + "]}");
            if (answer.status != 200) return;
        }
    });
    HttpClient client(server.port());
    int half = 0;
    for (int i = 0; i < pages; ++i) {
        const std::string body = client.ask("GET /config?prefix=pair.").body;
        const std::string mark = "\"value\":{\"type\":\"int\",\"value\":";
        const auto begin = body.find(mark) + mark.size();
        const std::string value = body.substr(begin, body.find('}', begin) - begin);
        const std::string whole =
            "{\"items\":[" + item("pair.a", value) + ',' + item("pair.b", value) + "]}";
        if (body != whole) ++half;
    }
    done = true;
    writer.join();
    patcher.join();
    EXPECT_EQ(half, 0);
}

TEST_F(ServerRaces, ClientsThatEndTheirWatchesMeetTheEndOfTheServer) {
    for (int round = 0; round < 20; ++round) {
        auto server = std::make_unique<Server>(store, options);
        std::vector<std::unique_ptr<HttpClient>> clients;
        for (const char* const line : {"GET /watch?key=key", "GET /changes", "GET /changes"}) {
            clients.push_back(std::make_unique<HttpClient>(server->port()));
            EXPECT_EQ(clients.back()->ask(line).status, 200);
        }
        std::atomic<bool> done{false};
        std::thread writer([&] {
            for (int i = 0; !done; ++i) store->set("key", i);
        });
        std::thread leaver([&] { clients.clear(); });
        server->stop();
        leaver.join();
        server.reset();
        done = true;
        writer.join();
    }
    // Nobody is left to be told.
    store->set("key", std::string("last"));
    const Server next(store, options);
    EXPECT_EQ(HttpClient(next.port()).ask("GET /config/key").body,
              R"({"key":"key","layers":[{"source":"override",)"
              R"("value":{"type":"string","value":"last"}}]})");
}

TEST_F(ServerRaces, WhatIsSecretIsShownToNobodyWhileSettingsComeAndGo) {
    store->set("pin", std::string("4711"));
    const Server server(store, options);
    const Setting<std::string> always(store, "pin", settings::secret());
    std::atomic<bool> done{false};
    std::thread maker([&] {
        while (!done) {
            const Setting<std::string> other(store, "pin");
            const Setting<int> another(store, "other", 1);
        }
    });
    HttpClient client(server.port());
    for (int i = 0; i < 50; ++i) {
        for (const char* const line : {"GET /settings", "GET /config", "GET /config/pin"}) {
            EXPECT_EQ(client.ask(line).body.find("4711"), std::string::npos) << line;
        }
    }
    done = true;
    maker.join();
}

TEST_F(ServerRaces, LayersComeAndGoWhileTheyAreListed) {
    const Server server(store, options);
    std::atomic<bool> done{false};
    std::thread changer([&] {
        while (!done) {
            store->addInMemorySource("site", "site.", 5, false, {{"key", 1}});
            store->removeSource("site");
        }
    });
    HttpClient client(server.port());
    for (int i = 0; i < 50; ++i) {
        for (const char* const line :
             {"GET /sources", "GET /config", "GET /history", "GET /metrics", "GET /readyz"}) {
            EXPECT_EQ(client.ask(line).status, 200) << line;
        }
    }
    done = true;
    changer.join();
}

}  // namespace
}  // namespace velkor::http
