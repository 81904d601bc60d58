#pragma once

#include <gtest/gtest.h>

#include <future>
#include <memory>
#include <string>
#include <utility>
#include <variant>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "http/ServerOptions.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/Service.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::testing {

using Headers = std::vector<std::pair<std::string_view, std::string>>;

/// A service in front of a store, called as the transport calls it.
class ServiceTest : public ::testing::Test {
protected:
    using Response = http::detail::Response;
    using FeedPtr = std::unique_ptr<http::detail::EventFeed>;

    ServiceTest() { options.allowWrites = true; }

    /// The service, made with the options as they are now.
    http::detail::Handler& service() {
        if (handler == nullptr) handler = http::detail::makeService(store, options, counts);
        return *handler;
    }

    static http::detail::Request request(const std::string& method, const std::string& target,
                                         const std::string& body = "",
                                         const Headers& headers = {}) {
        http::detail::Request made{method, target, {{"host", "localhost"}}, body, {}};
        made.client.address = "127.0.0.1:50312";
        for (const auto& header : headers) {
            if (header.first == "host") made.headers.clear();
        }
        made.headers.insert(made.headers.end(), headers.begin(), headers.end());
        return made;
    }

    std::future<http::detail::Answer> sendLater(http::detail::Request&& sent) {
        const auto answered = std::make_shared<std::promise<http::detail::Answer>>();
        auto answer = answered->get_future();
        service().handle(std::move(sent), [answered](http::detail::Answer&& given) {
            answered->set_value(std::move(given));
        });
        return answer;
    }

    static http::detail::Answer awaited(std::future<http::detail::Answer>&& answer) {
        if (answer.wait_for(patience) != std::future_status::ready) {
            throw std::runtime_error("no answer");
        }
        return answer.get();
    }

    Response sendRequest(http::detail::Request&& sent) {
        return std::get<Response>(awaited(sendLater(std::move(sent))));
    }

    Response send(const std::string& method, const std::string& target,
                  const std::string& body = "", const Headers& headers = {}) {
        return sendRequest(request(method, target, body, headers));
    }

    Response get(const std::string& target, const Headers& headers = {}) {
        return send("GET", target, "", headers);
    }

    /// The reply to a message; `type` is the name of its class.
    Response message(const std::string& type, const std::string& json) {
        return send("POST", "/velkor/configuration/" + type, json);
    }

    FeedPtr open(const std::string& target) {
        return std::get<FeedPtr>(awaited(sendLater(request("GET", target))));
    }

    static std::string headerOf(const Response& response, const std::string& name) {
        for (const auto& [sent, value] : response.headers) {
            if (sent == name) return value;
        }
        return "<none>";
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    http::ServerOptions options;
    std::shared_ptr<http::detail::TransportCounts> counts =
        std::make_shared<http::detail::TransportCounts>();
    std::shared_ptr<http::detail::Handler> handler;
};

/// "404 /problems/not-found DETAIL" of a problem; anything else as it is.
inline std::string problemIn(const http::detail::Response& response) {
    const std::string text = std::to_string(response.status) + " ";
    if (response.contentType != "application/problem+json") return text + response.body;
    const auto member = [&](const std::string& name) {
        const std::string begin = "\"" + name + "\":\"";
        const auto position = response.body.find(begin) + begin.size();
        return response.body.substr(position, response.body.find('"', position) - position);
    };
    const auto detail = response.body.find("\"detail\":\"") + 10;
    return text + member("type") + " " +
           response.body.substr(detail, response.body.size() - detail - 2);
}

}  // namespace velkor::testing
