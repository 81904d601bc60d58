#pragma once

#include <dlfcn.h>

#include <stdexcept>
#include <string>

namespace velkor::testing {

/// A shared library that is loaded, with its symbols kept local, while this lives.
class LoadedLibrary {
public:
    explicit LoadedLibrary(const std::string& path)
        : handle(::dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL)) {
        if (handle == nullptr) throw std::runtime_error(::dlerror());
    }
    ~LoadedLibrary() { ::dlclose(handle); }

    LoadedLibrary(const LoadedLibrary&) = delete;
    LoadedLibrary& operator=(const LoadedLibrary&) = delete;

    /// The function called `name`, which has the type `Function`.
    template <class Function>
    Function& function(const char* name) const {
        void* const symbol = ::dlsym(handle, name);
        if (symbol == nullptr) throw std::runtime_error(::dlerror());
        return *reinterpret_cast<Function*>(symbol);
    }

private:
    void* const handle;
};

}  // namespace velkor::testing
