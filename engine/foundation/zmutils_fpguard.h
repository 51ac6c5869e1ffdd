#pragma once

#include "engine/platform/fpexceptions.h"

namespace zm {

/// Masks all six floating-point exceptions of the calling thread while it lives and puts back the
/// masks that it found: hosts and libraries differ in what they leave unmasked. To be destroyed
/// on the thread that made it.
class TZmFPExceptionsDisabler {
public:
    TZmFPExceptionsDisabler() : before_(platform::GetFpMasks()) { platform::SetFpMasks({}); }
    ~TZmFPExceptionsDisabler() { platform::SetFpMasks(before_); }
    TZmFPExceptionsDisabler(const TZmFPExceptionsDisabler&) = delete;
    TZmFPExceptionsDisabler& operator=(const TZmFPExceptionsDisabler&) = delete;

private:
    platform::TFpMasks before_;
};

}  // namespace zm
