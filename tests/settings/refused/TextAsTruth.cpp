#include <memory>
#include <optional>

#include "settings/Bound.hpp"
#include "settings/Setting.hpp"

using Store = std::shared_ptr<velkor::configuration::ConfigurationImpl>;

struct Flags {
    bool verbose = false;
};

#ifdef MISTAKE_PUT_RIGHT
#define DEFAULT false
#else
#define DEFAULT "false"
#endif

bool declare(const Store& store) {
#if defined(IN_A_STRUCT)
    const velkor::settings::Bound<Flags> flags(
        store, "", velkor::settings::fields(&Flags::verbose, "verbose", DEFAULT));
    return flags.snapshot()->verbose;
#elif defined(OPTIONAL)
    return velkor::settings::Setting<std::optional<bool>>(store, "verbose", DEFAULT).get() == true;
#else
    return velkor::settings::Setting<bool>(store, "verbose", DEFAULT,
                                           velkor::settings::description("says more"));
#endif
}
