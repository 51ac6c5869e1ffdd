#include "tests/support/testfiles.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <fstream>
#include <iterator>
#include <random>
#include <system_error>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/console.h"
#include "engine/platform/files.h"

namespace zm::test {
namespace fs = std::filesystem;
namespace {

std::string UniqueFolderName() {
    static std::atomic<std::uint32_t> counter{0};
    std::random_device device;
    return "zmtest-" + std::to_string(device()) + "-" + std::to_string(device()) + "-" +
           std::to_string(counter.fetch_add(1));
}

std::int32_t ColumnNumber(const std::string& text) {
    return ParseInteger(std::string_view(text)).value_or(0);
}

}  // namespace

TempFolder::TempFolder() {
    path_ = fs::path(platform::TemporaryFolder()) / UniqueFolderName();
    fs::create_directories(path_);
}

TempFolder::~TempFolder() {
    std::error_code error;
    fs::remove_all(path_, error);
    if (error) {
        ADD_FAILURE() << "folder of the test stays: " << error.message();
    }
}

fs::path TempFolder::File(const std::string& name) const {
    return path_ / PathFromUtf8(name);
}

std::u16string TempFolder::Name(const std::string& name) const {
    return EngineName(File(name));
}

std::vector<std::uint8_t> ReadFileBytes(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    EXPECT_TRUE(file.is_open()) << path;
    return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

void WriteFileBytes(const fs::path& path, const std::vector<std::uint8_t>& bytes) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(reinterpret_cast<const char*>(bytes.data()),
               static_cast<std::streamsize>(bytes.size()));
    file.close();
    EXPECT_TRUE(file.good()) << path;
}

std::vector<std::string> ListFolder(const fs::path& path) {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(path)) {
        names.push_back(Utf8FromUtf16(EngineName(entry.path().filename())));
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::u16string EngineName(const fs::path& path) {
    if constexpr (sizeof(fs::path::value_type) == 1) {
        return Utf16FromUtf8(reinterpret_cast<const char*>(path.c_str()));
    } else {
        return {path.native().begin(), path.native().end()};
    }
}

fs::path PathFromUtf8(const std::string& text) {
    if constexpr (sizeof(fs::path::value_type) == 1) {
        return {text};
    } else {
        return {Utf16FromUtf8(text)};
    }
}

std::optional<fs::path> CorpusFolder() {
    fs::path folder = fs::path(ZM_SOURCE_DIR) / ".." / "shared" / "corpus";
    if (const auto named = platform::EnvironmentVariable("ZM_CORPUS")) {
        folder = PathFromUtf8(*named);
    }
    std::error_code error;
    if (!fs::is_regular_file(folder / "MANIFEST.tsv", error)) {
        return std::nullopt;
    }
    return fs::absolute(folder);
}

std::vector<CorpusEntry> CorpusEntries() {
    std::vector<CorpusEntry> entries;
    const auto folder = CorpusFolder();
    if (!folder) {
        return entries;
    }
    std::ifstream list(*folder / "MANIFEST.tsv", std::ios::binary);
    std::string line;
    std::getline(list, line);  // the heads of the columns
    while (std::getline(list, line)) {
        const auto columns = SplitText(line, '\t');
        if (columns.size() < 8) {
            continue;
        }
        entries.push_back({*folder / PathFromUtf8(columns[0]), columns[1], ColumnNumber(columns[2]),
                           ColumnNumber(columns[3]), columns[7]});
    }
    return entries;
}

}  // namespace zm::test
