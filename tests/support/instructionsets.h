#pragma once

#include <gtest/gtest.h>
#include <hwy/targets.h>

#include <cstdint>

/// Tests of code that is compiled for several instruction sets and chooses one at run time.
namespace zm::test {

/// Runs a test's body once for each instruction set of this processor, until it fails; the best
/// one is in use again afterwards.
template <typename Body>
void ForEachInstructionSet(Body&& body) {
    const auto use = [](std::int64_t sets) {
        hwy::SetSupportedTargetsForTest(sets);
        hwy::GetChosenTarget().Update(hwy::SupportedTargets());
    };
    const std::int64_t all = hwy::SupportedTargets();
    for (std::int64_t left = all; left != 0 && !::testing::Test::HasFailure(); left &= left - 1) {
        SCOPED_TRACE(::testing::Message() << "instruction set " << hwy::TargetName(left & -left));
        use(left & -left);
        body();
    }
    use(0);
}

}  // namespace zm::test
