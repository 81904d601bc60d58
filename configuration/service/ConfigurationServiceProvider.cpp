#include "configuration/service/ConfigurationServiceProvider.hpp"

namespace velkor {

template class MessageAPI<configuration::ConfigurationGet,
                          configuration::ConfigurationServiceProvider>;
template class MessageAPI<configuration::ConfigurationSet,
                          configuration::ConfigurationServiceProvider>;
template class MessageAPI<configuration::ConfigurationKeys,
                          configuration::ConfigurationServiceProvider>;
template class MessageAPI<configuration::AddPropertyFileSource,
                          configuration::ConfigurationServiceProvider>;
template class ServiceProviderAPI<configuration::ConfigurationServiceProvider>;

namespace configuration {

ConfigurationServiceProvider::~ConfigurationServiceProvider() = default;

}  // namespace configuration

}  // namespace velkor
