// Runs a fuzz target over files without the fuzz engine: its seeds and past crashes as an
// ordinary test. Arguments are files or folders; folders are walked with all below them.

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <system_error>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace {

namespace fs = std::filesystem;

/// Adds the files of an argument in a stable order; false when it cannot be looked at.
bool CollectFiles(const fs::path& argument, std::vector<fs::path>& files) {
    std::error_code error;
    if (fs::is_regular_file(argument, error)) {
        files.push_back(argument);
        return true;
    }
    std::vector<fs::path> found;
    for (fs::recursive_directory_iterator at(argument, error), end; !error && at != end;
         at.increment(error)) {
        if (at->is_regular_file()) {
            found.push_back(at->path());
        }
    }
    std::sort(found.begin(), found.end());
    files.insert(files.end(), found.begin(), found.end());
    return !error;
}

bool RunFile(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file.is_open()) {
        return false;
    }
    const std::vector<char> bytes{std::istreambuf_iterator<char>(file),
                                  std::istreambuf_iterator<char>()};
    LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    return true;
}

}  // namespace

int main(int argc, char** argv) {
    std::vector<fs::path> files;
    for (int i = 1; i < argc; ++i) {
        if (!CollectFiles(argv[i], files)) {
            std::cerr << "cannot read " << argv[i] << "\n";
            return 1;
        }
    }
    for (const fs::path& path : files) {
        if (!RunFile(path)) {
            std::cerr << "cannot read " << path << "\n";
            return 1;
        }
    }
    std::cout << files.size() << " files replayed\n";
    return files.empty() ? 1 : 0;
}
