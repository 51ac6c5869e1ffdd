// The contest of the neural palette and the moves after it over whole vectors of neurons. Integer
// arithmetic: the same numbers as plain loops give.

#include <cstddef>

#include "engine/foundation/zmnumbers.h"
#include "engine/proc/neurquant_p.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "engine/proc/neurquant_vectors.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace zm::HWY_NAMESPACE {

namespace hn = hwy::HWY_NAMESPACE;

TContestResult FindWinners(const TContestView& neurons, std::int32_t b, std::int32_t g,
                           std::int32_t r) {
    const hn::CappedTag<std::int32_t, kContestBlock> tag;
    const auto blue = hn::Set(tag, b);
    const auto green = hn::Set(tag, g);
    const auto red = hn::Set(tag, r);
    auto number = hn::Iota(tag, 0);
    auto closest = hn::Set(tag, kMaxInt32);
    auto winner = closest;
    const std::size_t lanes = hn::Lanes(tag);
    for (std::size_t i = 0; i < neurons.count; i += lanes) {
        const auto distance =
            hn::Add(hn::Add(hn::Abs(hn::Sub(hn::LoadU(tag, neurons.blue + i), blue)),
                            hn::Abs(hn::Sub(hn::LoadU(tag, neurons.green + i), green))),
                    hn::Abs(hn::Sub(hn::LoadU(tag, neurons.red + i), red)));
        const auto bias = hn::LoadU(tag, neurons.bias + i);
        const auto freq = hn::LoadU(tag, neurons.freq + i);
        const auto biased = hn::Sub(distance, hn::ShiftRight<kBiasShift>(bias));
        closest = hn::Min(closest, hn::Add(hn::ShiftLeft<kContestNumberBits>(distance), number));
        winner = hn::Min(winner, hn::Add(hn::ShiftLeft<kContestNumberBits>(biased), number));
        const auto decay = hn::ShiftRight<kBetaShift>(freq);
        hn::StoreU(hn::Sub(freq, decay), tag, neurons.freq + i);
        hn::StoreU(hn::Add(bias, hn::ShiftLeft<kBetaShift>(decay)), tag, neurons.bias + i);
        number = hn::Add(number, hn::Set(tag, static_cast<std::int32_t>(lanes)));
    }
    constexpr std::int32_t kMask = (1 << kContestNumberBits) - 1;
    return {hn::GetLane(hn::MinOfLanes(tag, closest)) & kMask,
            hn::GetLane(hn::MinOfLanes(tag, winner)) & kMask};
}

void MoveValues(std::int32_t* values, const std::int32_t* powers, std::size_t count,
                std::int32_t target) {
    constexpr int kPowerShift = 18;
    const hn::CappedTag<std::int32_t, kContestBlock> tag;
    const auto goal = hn::Set(tag, target);
    const auto below_one = hn::Set(tag, (1 << kPowerShift) - 1);
    const std::size_t lanes = hn::Lanes(tag);
    for (std::size_t i = 0; i < count; i += lanes) {
        // Numbers behind the last one stay as they are: power 0.
        const auto power =
            hn::IfThenElseZero(hn::FirstN(tag, count - i), hn::LoadU(tag, powers + i));
        const auto value = hn::LoadU(tag, values + i);
        auto product = hn::Mul(hn::Sub(value, goal), power);
        product = hn::Add(product, hn::And(hn::BroadcastSignBit(product), below_one));
        hn::StoreU(hn::Sub(value, hn::ShiftRight<kPowerShift>(product)), tag, values + i);
    }
}

}  // namespace zm::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace zm {

HWY_EXPORT(FindWinners);
HWY_EXPORT(MoveValues);

TContestResult RunContest(const TContestView& neurons, std::int32_t b, std::int32_t g,
                          std::int32_t r) {
    return HWY_DYNAMIC_DISPATCH(FindWinners)(neurons, b, g, r);
}

void MoveToward(std::int32_t* values, const std::int32_t* powers, std::size_t count,
                std::int32_t target) {
    HWY_DYNAMIC_DISPATCH(MoveValues)(values, powers, count, target);
}

}  // namespace zm
#endif
