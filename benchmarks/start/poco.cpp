#include <Poco/AutoPtr.h>
#include <Poco/Util/LayeredConfiguration.h>
#include <Poco/Util/PropertyFileConfiguration.h>

// start-poco FILE
int main(int, char** argv) {
    using namespace Poco::Util;
    Poco::AutoPtr<LayeredConfiguration> layers(new LayeredConfiguration);
    layers->add(Poco::AutoPtr<PropertyFileConfiguration>(new PropertyFileConfiguration(argv[1])), 1,
                false);
    return 0;
}
