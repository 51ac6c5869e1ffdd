#include "actions/uImageList.h"

namespace zm {

// The lookup alone can report: that the job has no image.

bool TQVImageList::TextOut(const IStepParams& params) {
    static_cast<void>(JobBitmap(params.GetTaskId()));
    return false;
}

bool TQVImageList::DrawImage(const IStepParams& params) {
    static_cast<void>(JobBitmap(params.GetTaskId()));
    return false;
}

}  // namespace zm
