#include "layers/etcd/Loggers.hpp"

namespace velkor::layers {

const common::DiagnosticLogger etcdLogger("velkor::layers::etcd");

}  // namespace velkor::layers
