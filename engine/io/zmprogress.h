#pragma once

#include <cstdint>
#include <functional>

namespace zm {

/// OnProgress(sender, percent 0 to 100). Empty when nobody listens.
using TZmProgressEvent = std::function<void(void* sender, std::int32_t percent)>;

/// What the driver hands to every codec. A codec sets `per1` to 100 / rows, reports
/// Trunc(row * per1) when the event is set and the percent changed, and asks `*Aborting` after
/// each row. It signals a failure by setting `*Aborting` and returning.
struct TProgressRec {
    TZmProgressEvent fOnProgress;
    void* Sender = nullptr;
    std::int32_t val = 0;  ///< last percent reported
    std::int32_t tot = 0;
    double per1 = 0;
    double per2 = 0;
    bool* Aborting = nullptr;  ///< never nil
};

/// One row is done: reports Trunc(units_done * per1) on change. False when the work is to stop.
[[nodiscard]] bool StepProgress(TProgressRec& progress, std::int64_t units_done);

}  // namespace zm
