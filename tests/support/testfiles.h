#pragma once

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

/// Files and folders for tests.
namespace zm::test {

/// A folder of its own below the system's folder for temporary files; removed with its contents.
class TempFolder {
public:
    TempFolder();
    ~TempFolder();
    TempFolder(const TempFolder&) = delete;
    TempFolder& operator=(const TempFolder&) = delete;
    const std::filesystem::path& Path() const { return path_; }
    std::filesystem::path File(const std::string& name) const;
    /// The same as the engine's kind of file name. `name` is UTF-8.
    std::u16string Name(const std::string& name) const;

private:
    std::filesystem::path path_;
};

/// All bytes of a file; a missing file fails the test and gives none.
std::vector<std::uint8_t> ReadFileBytes(const std::filesystem::path& path);
void WriteFileBytes(const std::filesystem::path& path, const std::vector<std::uint8_t>& bytes);
/// Names in a folder, sorted, in UTF-8; not recursive.
std::vector<std::string> ListFolder(const std::filesystem::path& path);
/// The engine's form of a path.
std::u16string EngineName(const std::filesystem::path& path);
/// A path from UTF-8 text.
std::filesystem::path PathFromUtf8(const std::string& text);

/// Folder of the sample files, from the environment variable ZM_CORPUS or beside the sources;
/// nothing when it is not there, and such tests are then skipped.
std::optional<std::filesystem::path> CorpusFolder();

/// A sample file. Width and height are 0 where the list tells none.
struct CorpusEntry {
    std::filesystem::path path;  ///< absolute
    std::string format;
    std::int32_t width = 0;
    std::int32_t height = 0;
    std::string note;
};
/// Rows of the list of sample files; empty without the folder.
std::vector<CorpusEntry> CorpusEntries();

}  // namespace zm::test
