#include "engine/io/zmprogress.h"

#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {

bool StepProgress(TProgressRec& progress, std::int64_t units_done) {
    ZM_ASSERT(progress.Aborting != nullptr);
    const std::int32_t percent = TruncToInt(static_cast<double>(units_done) * progress.per1);
    if (percent != progress.val) {
        progress.val = percent;
        if (progress.fOnProgress) {
            progress.fOnProgress(progress.Sender, percent);
        }
    }
    return !*progress.Aborting;
}

}  // namespace zm
