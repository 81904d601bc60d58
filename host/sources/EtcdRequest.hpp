#pragma once

#include <memory>
#include <string>
#include <vector>

#include "configuration/sources/ConfigurationSource.hpp"
#include "layers/etcd/EtcdOptions.hpp"

namespace velkor::host {

/// Where the values of a layer in etcd are, and how they are followed.
struct EtcdRequest {
    std::vector<std::string> endpoints{};
    std::string prefix{};
    layers::EtcdOptions options{};
};

/// The layer that `request` describes. Throws `std::runtime_error`:
///
/// - as `layers::EtcdSource::open`, when there is no server and the options want one;
/// - "Not an etcd endpoint: TEXT; http://HOST:PORT or https://HOST:PORT is needed";
/// - "--etcd needs velkor::etcd, which this velkor-config was built without: " and the first
///   endpoint when that is so.
std::shared_ptr<configuration::ConfigurationSource> openEtcd(const EtcdRequest& request);

}  // namespace velkor::host
