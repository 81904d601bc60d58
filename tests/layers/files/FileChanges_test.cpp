#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "tests/layers/files/FollowingStore.hpp"

namespace velkor::layers {
namespace {

namespace fs = std::filesystem;

using ::testing::ElementsAre;
using testing::FileFolder;
using testing::OpenFile;
using ::testing::UnorderedElementsAre;

// One way in which a file gets another content.
struct Way {
    const char* name;
    std::function<void(const FileFolder&, const std::string& text)> prepare;
    std::function<void(const FileFolder&, const std::string& text)> change;
};

fs::path fileIn(const FileFolder& folder) {
    return folder / "a" / "file";
}

void makeFolder(const FileFolder& folder) {
    fs::create_directories(folder / "a");
}

// The file stands in a folder.
void plainly(const FileFolder& folder, const std::string& text) {
    makeFolder(folder);
    FileFolder::write(fileIn(folder), text);
}

// The file is reached over a link to another folder.
void overALink(const FileFolder& folder, const std::string& text) {
    makeFolder(folder);
    fs::create_directories(folder / "b");
    FileFolder::write(folder / "b" / "target", text);
    fs::create_symlink("../b/target", fileIn(folder));
}

// As container platforms mount it: the file is a link over a link to a folder of its own.
void overASwappedFolder(const FileFolder& folder, const std::string& text) {
    makeFolder(folder);
    fs::create_directories(folder / "a" / "..1");
    FileFolder::write(folder / "a" / "..1" / "file", text);
    fs::create_symlink("..1", folder / "a" / "..data");
    fs::create_symlink("..data/file", fileIn(folder));
}

void nothing(const FileFolder&, const std::string&) {}

std::string newName() {
    static int names = 0;
    return "new" + std::to_string(++names);
}

const std::vector<Way> ways{
    {"WrittenInPlace", plainly,
     [](const auto& folder, const auto& text) { FileFolder::write(fileIn(folder), text); }},
    {"AppendedTo", plainly,
     [](const auto& folder, const auto& text) {
         const OpenFile file(fileIn(folder), O_APPEND);
         file.write(text);
     }},
    {"Replaced", plainly,
     [](const auto& folder, const auto& text) { FileFolder::replace(fileIn(folder), text); }},
    {"ReplacedFromAnotherFolder", plainly,
     [](const auto& folder, const auto& text) {
         const auto other = folder / newName();
         FileFolder::write(other, text);
         fs::rename(other, fileIn(folder));
     }},
    {"MovedAwayAndWritten", plainly,
     [](const auto& folder, const auto& text) {
         fs::rename(fileIn(folder), fileIn(folder).string() + "~");
         FileFolder::write(fileIn(folder), text);
     }},
    {"RemovedAndWritten", plainly,
     [](const auto& folder, const auto& text) {
         fs::remove(fileIn(folder));
         FileFolder::write(fileIn(folder), text);
     }},
    {"RemovedAndHardLinked", plainly,
     [](const auto& folder, const auto& text) {
         const auto other = folder / newName();
         FileFolder::write(other, text);
         fs::remove(fileIn(folder));
         fs::create_hard_link(other, fileIn(folder));
     }},
    {"WrittenByAnotherNameOfIt", plainly,
     [](const auto& folder, const auto& text) {
         const auto other = folder / newName();
         fs::create_hard_link(fileIn(folder), other);
         FileFolder::write(other, text);
     }},
    {"LinkedElsewhere", plainly,
     [](const auto& folder, const auto& text) {
         const auto other = folder / newName();
         FileFolder::write(other, text);
         FileFolder::relink(fileIn(folder), other);
     }},
    {"TargetWritten", overALink,
     [](const auto& folder, const auto& text) {
         FileFolder::write(folder / "b" / "target", text);
     }},
    {"TargetReplaced", overALink,
     [](const auto& folder, const auto& text) {
         FileFolder::replace(folder / "b" / "target", text);
     }},
    {"TargetsFolderReplaced", overALink,
     [](const auto& folder, const auto& text) {
         const auto other = newName();
         fs::create_directories(folder / other);
         FileFolder::write(folder / other / "target", text);
         fs::rename(folder / "b", folder / newName());
         fs::rename(folder / other, folder / "b");
     }},
    {"LinkReplacedByAFile", overALink,
     [](const auto& folder, const auto& text) { FileFolder::replace(fileIn(folder), text); }},
    {"FolderSwapped", overASwappedFolder,
     [](const auto& folder, const auto& text) {
         const auto other = newName();
         fs::create_directories(folder / "a" / other);
         FileFolder::write(folder / "a" / other / "file", text);
         const auto former = fs::read_symlink(folder / "a" / "..data");
         FileFolder::relink(folder / "a" / "..data", other);
         fs::remove_all(folder / "a" / former);
     }},
    {"FolderReplaced", plainly,
     [](const auto& folder, const auto& text) {
         const auto other = newName();
         fs::create_directories(folder / other);
         FileFolder::write(folder / other / "file", text);
         fs::rename(folder / "a", folder / newName());
         fs::rename(folder / other, folder / "a");
     }},
    {"FolderRemovedAndMade", plainly,
     [](const auto& folder, const auto& text) {
         fs::remove_all(folder / "a");
         plainly(folder, text);
     }},
    {"FolderMade", nothing,
     [](const auto& folder, const auto& text) {
         fs::remove_all(folder / "a");
         plainly(folder, text);
     }},
    {"FolderMovedHere", nothing,
     [](const auto& folder, const auto& text) {
         const auto other = newName();
         fs::create_directories(folder / other);
         FileFolder::write(folder / other / "file", text);
         fs::remove_all(folder / "a");
         fs::rename(folder / other, folder / "a");
     }},
};

class FileChanges : public ::testing::TestWithParam<Way> {
protected:
    FollowingStore following;
    FileFolder folder;
};

TEST_P(FileChanges, AreToldEachTime) {
    GetParam().prepare(folder, "key=0\n");
    ReloadingFileOptions options;
    options.mustBeReadable = false;
    // So that only what the system tells of counts.
    options.lookEvery = std::chrono::hours(1);
    following.follow(fileIn(folder), options);

    for (const std::string text : {"key=1", "key=2", "key=3"}) {
        GetParam().change(folder, text + "\n");
        ASSERT_TRUE(following.isTold(text)) << text;
    }
}

INSTANTIATE_TEST_SUITE_P(Ways, FileChanges, ::testing::ValuesIn(ways),
                         [](const auto& way) { return way.param.name; });

}  // namespace
}  // namespace velkor::layers
