/// The part of Highway that is not in its headers and that choosing an instruction set at run time
/// needs: which sets the processor has, and which one was chosen. Where the library exists as a
/// shared object only (Debian) these stand in for it: loading that object measures the clock of
/// the processor for 3 ms, more than a whole small job takes. Where there is a static library,
/// which brings only what is used, it is linked and this file is not.

#include <hwy/base.h>
#include <hwy/targets.h>

#include <atomic>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstdlib>

#if HWY_ARCH_X86
#include <cpuid.h>
#endif

namespace hwy {
namespace {

std::atomic<std::int64_t> mocked_targets{0};
std::atomic<std::int64_t> disabled_targets_now{0};

#if HWY_ARCH_X86

struct TCpuRegisters {
    unsigned a = 0;
    unsigned b = 0;
    unsigned c = 0;
    unsigned d = 0;
};

TCpuRegisters ReadCpuLeaf(unsigned leaf, unsigned sub_leaf = 0) {
    TCpuRegisters regs;
    __cpuid_count(leaf, sub_leaf, regs.a, regs.b, regs.c, regs.d);
    return regs;
}

/// Whether all bits of a mask are set.
bool Has(std::uint64_t value, std::uint64_t mask) {
    return (value & mask) == mask;
}

/// Which register states the operating system keeps (XCR0).
std::uint64_t ReadKeptStates() {
    unsigned low = 0;
    unsigned high = 0;
    __asm__ volatile("xgetbv" : "=a"(low), "=d"(high) : "c"(0));
    return std::uint64_t{high} << 32 | low;
}

// Bits of the processor's feature words, by its manufacturer's manual (CPUID leaves 1, 7 and
// 80000001h), for what the library compiles each of its sets with.
constexpr std::uint64_t kLeaf1Ssse3 = 1u << 9;
constexpr std::uint64_t kLeaf1Sse4 = 1u << 19 | 1u << 20 | 1u << 1 | 1u << 25;  // with PCLMUL, AES
constexpr std::uint64_t kLeaf1Avx = 1u << 27 | 1u << 28 | 1u << 12 | 1u << 29;  // with FMA, F16C
constexpr std::uint64_t kLeaf7Avx2 = 1u << 5 | 1u << 3 | 1u << 8;               // with BMI, BMI2
constexpr std::uint64_t kLeaf7Avx512 = 1u << 16 | 1u << 17 | 1u << 30 | 1u << 31;  // F DQ BW VL
// VBMI, VBMI2, VAES, VPCLMULQDQ, VNNI, BITALG, VPOPCNTDQ in the third word, AVX-VNNI in sub-leaf 1
constexpr std::uint64_t kLeaf7Vbmi =
    1u << 1 | 1u << 6 | 1u << 9 | 1u << 10 | 1u << 11 | 1u << 12 | 1u << 14;
constexpr std::uint64_t kLeaf7Sub1AvxVnni = 1u << 4;
constexpr std::uint64_t kExtendedLzcnt = 1u << 5;
constexpr std::uint64_t kStatesAvx = 0x06;
constexpr std::uint64_t kStatesAvx512 = 0xE6;
constexpr unsigned kExtendedLeaf = 0x80000001u;

std::int64_t DetectTargets() {
    std::int64_t targets = HWY_STATIC_TARGET;
    const std::uint64_t leaf1 = ReadCpuLeaf(1).c;
    if (!Has(leaf1, kLeaf1Ssse3)) {
        return targets;
    }
    targets |= HWY_SSSE3;
    if (!Has(leaf1, kLeaf1Sse4)) {
        return targets;
    }
    targets |= HWY_SSE4;
    if (!Has(leaf1, kLeaf1Avx) || ReadCpuLeaf(0).a < 7) {
        return targets;
    }
    const std::uint64_t leaf7 = ReadCpuLeaf(7).b;
    const std::uint64_t states = ReadKeptStates();
    if (!Has(leaf7, kLeaf7Avx2) || !Has(states, kStatesAvx) ||
        !Has(ReadCpuLeaf(kExtendedLeaf).c, kExtendedLzcnt)) {
        return targets;
    }
    targets |= HWY_AVX2;
    if (Has(leaf7, kLeaf7Avx512) && Has(states, kStatesAvx512)) {
        targets |= HWY_AVX3;
        const bool has_vbmi =
            Has(ReadCpuLeaf(7).c, kLeaf7Vbmi) && Has(ReadCpuLeaf(7, 1).a, kLeaf7Sub1AvxVnni);
        targets |= has_vbmi ? HWY_AVX3_DL : 0;
    }
    return targets;
}

#else

std::int64_t DetectTargets() {
    return HWY_STATIC_TARGET;
}

#endif

}  // namespace

std::int64_t SupportedTargets() {
    static const std::int64_t detected = DetectTargets();
    const std::int64_t mocked = mocked_targets.load();
    const std::int64_t targets = (mocked != 0 ? mocked : detected) & ~disabled_targets_now.load();
    return targets != 0 ? targets : HWY_STATIC_TARGET;
}

void DisableTargets(std::int64_t disabled_targets) {
    disabled_targets_now.store(disabled_targets);
}

void SetSupportedTargetsForTest(std::int64_t targets) {
    mocked_targets.store(targets);
}

ChosenTarget& GetChosenTarget() {
    static ChosenTarget chosen_target;
    return chosen_target;
}

void Abort(const char* file, int line, const char* format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    std::fprintf(stderr, "%s:%d: ", file, line);
    std::vfprintf(stderr, format, arguments);
    std::fputc('\n', stderr);
    va_end(arguments);
    std::abort();
}

}  // namespace hwy
