#include "engine/platform/memory.h"

#include <dirent.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <fstream>
#include <memory>
#include <set>
#include <string>
#include <utility>

namespace zm::platform {
namespace {

constexpr std::size_t kLargePagesFrom = std::size_t{4} << 20;

constexpr char kCpuFolder[] = "/sys/devices/system/cpu/";
constexpr char kControlGroups[] = "/sys/fs/cgroup";

std::string FirstLineOf(const std::string& file_name) {
    std::ifstream file(file_name);
    std::string line;
    std::getline(file, line);
    return line;
}

/// A limit as the kernel writes it; `none` for no file, no number ("max") or 0.
std::int64_t LimitIn(const std::string& file_name, std::int64_t none) {
    std::ifstream file(file_name);
    std::int64_t value = 0;
    return file >> value && value > 0 ? value : none;
}

/// Folder of this process's control group below the common root, or empty.
std::string ControlGroupFolder() {
    std::ifstream groups("/proc/self/cgroup");
    std::string line;
    while (std::getline(groups, line)) {
        if (line.rfind("0::/", 0) == 0) {
            return line.substr(3);
        }
    }
    return {};
}

/// The machine's memory, or the share of it that the process's control group and the groups
/// around it leave, since beyond that share the process would be killed.
std::int64_t LimitByControlGroups(std::int64_t bytes) {
    bytes = std::min(bytes,
                     LimitIn(std::string(kControlGroups) + "/memory/memory.limit_in_bytes", bytes));
    std::string group = ControlGroupFolder();
    while (true) {
        bytes = std::min(bytes, LimitIn(kControlGroups + group + "/memory.max", bytes));
        const auto slash = group.rfind('/');
        if (slash == std::string::npos) {
            return bytes;
        }
        group.erase(slash);
    }
}

std::int64_t FindPhysicalMemory() {
    const std::int64_t pages = ::sysconf(_SC_PHYS_PAGES);
    const std::int64_t page_bytes = ::sysconf(_SC_PAGESIZE);
    return pages > 0 && page_bytes > 0 ? LimitByControlGroups(pages * page_bytes) : 0;
}

bool IsCpuName(const std::string& name) {
    return name.size() > 3 && name.rfind("cpu", 0) == 0 &&
           std::all_of(name.begin() + 3, name.end(),
                       [](unsigned char c) { return std::isdigit(c) != 0; });
}

/// Processors that share a core list the same siblings, so the number of different lists is the
/// number of cores. 0 when the folder tells nothing.
std::size_t CoresFromTopology() {
    const std::unique_ptr<DIR, int (*)(DIR*)> folder(::opendir(kCpuFolder), ::closedir);
    std::set<std::string> sibling_lists;
    while (folder != nullptr) {
        const dirent* const entry = ::readdir(folder.get());
        if (entry == nullptr) {
            break;
        }
        const std::string name = entry->d_name;
        if (IsCpuName(name)) {
            const std::string list =
                FirstLineOf(kCpuFolder + name + "/topology/thread_siblings_list");
            if (!list.empty()) {
                sibling_lists.insert(list);
            }
        }
    }
    return sibling_lists.size();
}

/// Different pairs of package and core in the processor list; without them, its entries.
std::size_t CoresFromProcessorList() {
    std::ifstream file("/proc/cpuinfo");
    std::set<std::pair<std::string, std::string>> cores;
    std::size_t processors = 0;
    std::string package;
    std::string line;
    while (std::getline(file, line)) {
        const auto colon = line.find(':');
        const std::string value = colon == std::string::npos ? "" : line.substr(colon + 1);
        if (line.rfind("processor", 0) == 0) {
            ++processors;
            package.clear();
        } else if (line.rfind("physical id", 0) == 0) {
            package = value;
        } else if (line.rfind("core id", 0) == 0) {
            cores.emplace(package, value);
        }
    }
    return cores.empty() ? processors : cores.size();
}

}  // namespace

std::int64_t PhysicalMemoryBytes() {
    static const std::int64_t bytes = FindPhysicalMemory();
    return bytes;
}

std::int32_t PhysicalCoreCount() {
    std::size_t cores = CoresFromTopology();
    if (cores == 0) {
        cores = CoresFromProcessorList();
    }
    return static_cast<std::int32_t>(std::clamp<std::size_t>(cores, 1, 65536));
}

void* SystemHeapAllocate(std::size_t size_bytes) {
    if (size_bytes == 0) {
        return nullptr;
    }
    void* const block =
        ::mmap(nullptr, size_bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (block == MAP_FAILED) {
        return nullptr;
    }
    // Large pages spare most of the page faults that a big image costs when it is first written.
    if (size_bytes >= kLargePagesFrom) {
        static_cast<void>(::madvise(block, size_bytes, MADV_HUGEPAGE));
    }
    return block;
}

void SystemHeapFree(void* block, std::size_t size_bytes) {
    if (block != nullptr) {
        ::munmap(block, size_bytes);
    }
}

}  // namespace zm::platform
