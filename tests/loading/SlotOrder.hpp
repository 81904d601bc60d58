#pragma once

#include <string>
#include <vector>

// What a program that was compiled with headers of its own calls: the functions of an interface,
// one after the other in the order of their slots, and the destructor at the end.
// Each takes a pointer to the interface and names what it has called.
namespace velkor::testing {

using Names = std::vector<std::string>;

Names callSubscription(void* object);
Names callSubscriber(void* object);
Names callPublisher(void* object);
Names callServiceMessage(void* object);
Names callServiceProvider(void* object);
Names callDeferredService(void* object);
Names callJsonSerializer(void* object);
Names callAdministration(void* object);
Names callCommandProvider(void* object);
Names callConfiguration(void* object);
Names callConfigurationSource(void* object);
Names callConfigurationServiceProvider(void* object);

}  // namespace velkor::testing
