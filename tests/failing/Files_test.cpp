// Property files that are followed, as far as the thread that makes them goes. What the thread that
// follows them does when it has no memory is left out.

#include <memory>
#include <string>

#include "layers/files/ReloadingFileSource.hpp"
#include "tests/failing/StoreScene.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationValue;
using layers::ReloadingFileOptions;
using layers::ReloadingFileSource;

/// A file that can be followed. Another one is, so that the thread is there.
struct FileScene {
    FileScene() {
        static const TemporaryFile other("key = value\n");
        static const ReloadingFileSource first(other.path());
    }

    void expectReadable() const {
        const ReloadingFileSource source(file.path());
        EXPECT_EQ(source.state().lastError, "");
    }

    const TemporaryFile file{longText("key") + " = " + longText("value") + "\n"};
};

void followAFile(Trial& trial) {
    const FileScene scene;
    ConfigurationValue read;
    if (trial.passes([&] {
            ReloadingFileSource source(scene.file.path());
            read = source.get(longText("key"));
        })) {
        EXPECT_EQ(textOf(read), textOf(ConfigurationValue(longText("value"))));
    }
    scene.expectReadable();
}

void followAMissingFile(Trial& trial) {
    const FileScene scene;
    ReloadingFileOptions options;
    options.mustBeReadable = false;
    std::string error;
    if (trial.passes([&] {
            const ReloadingFileSource source(scene.file.path().string() + longText(".missing"),
                                             options);
            error = source.state().lastError;
        })) {
        EXPECT_EQ(error.rfind("Property file could not be opened: ", 0), 0U);
    }
    scene.expectReadable();
}

void refuseAFileThatIsTooLarge(Trial& trial) {
    const FileScene scene;
    ReloadingFileOptions options;
    options.mostBytes = 1;
    std::string refusal;
    if (trial.passes([&] {
            try {
                const ReloadingFileSource source(scene.file.path(), options);
            } catch (const std::runtime_error& error) {
                refusal = error.what();
            }
        })) {
        EXPECT_EQ(refusal.rfind("Property file is larger than 1 bytes: ", 0), 0U);
    }
    scene.expectReadable();
}

constexpr Row fileRows[] = {
    {"FollowAFile", followAFile},
    {"FollowAMissingFile", followAMissingFile},
    {"RefuseAFileThatIsTooLarge", refuseAFileThatIsTooLarge},
};
VELKOR_FAILING_ROWS(FailingFiles, fileRows);

}  // namespace
}  // namespace velkor::testing
