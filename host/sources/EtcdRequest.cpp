#include "host/sources/EtcdRequest.hpp"

#include <stdexcept>

#if VELKOR_HAS_ETCD
#include "layers/etcd/EtcdSource.hpp"
#endif

namespace velkor::host {

std::shared_ptr<configuration::ConfigurationSource> openEtcd(const EtcdRequest& request) {
#if VELKOR_HAS_ETCD
    try {
        return layers::EtcdSource::open(request.endpoints, request.prefix, request.options);
    } catch (const std::invalid_argument& error) {
        throw std::runtime_error(std::string(error.what()) +
                                 "; http://HOST:PORT or https://HOST:PORT is needed");
    }
#else
    throw std::runtime_error(
        "--etcd needs velkor::etcd, which this velkor-config was built without: " +
        request.endpoints.front());
#endif
}

}  // namespace velkor::host
