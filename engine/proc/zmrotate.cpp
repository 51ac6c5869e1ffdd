// The choice of a rotation engine, the alpha plane along with the image, and what TZmBitmap
// offers of it.

#include "engine/proc/zmrotate.h"

#include <cmath>
#include <memory>
#include <new>
#include <utility>

#include "engine/proc/zmrotate_p.h"

namespace zm {
namespace {

enum class TRotateEngine : std::uint8_t { kNone, kQuarters, kInverse, kShears, kNearest };

/// What is to be done to the image and, with another background, to its plane.
struct TRotatePlan {
    TRotateEngine engine = TRotateEngine::kNone;
    TQuarterTurns turns = 0;  ///< for kQuarters, and before kShears
    double angle = 0;         ///< for the engines of free angles
    TZmAntialiasMode mode = zmrNone;
};

TRotatePlan MakeQuarterPlan(TQuarterTurns turns) {
    TRotatePlan plan;
    plan.engine = turns == 0 ? TRotateEngine::kNone : TRotateEngine::kQuarters;
    plan.turns = turns;
    return plan;
}

TRotatePlan MakeShearPlan(double angle) {
    const TShearAngle split = SplitShearAngle(angle);
    TRotatePlan plan = MakeQuarterPlan(split.turns);
    if (split.rest != 0) {
        plan.engine = TRotateEngine::kShears;
        plan.angle = split.rest;
    }
    return plan;
}

TRotatePlan MakePlan(TZmPixelFormat format, double angle, TZmAntialiasMode mode) {
    if (std::fmod(angle, 90.0) == 0) {
        const auto quarters = TruncToInt(std::fmod(angle, 360.0)) / 90;
        return MakeQuarterPlan((quarters + 4) % 4);
    }
    TRotatePlan plan;
    plan.angle = angle;
    plan.mode = mode;
    if (mode == zmrNone || (format != zm24RGB && format != zm1g)) {
        plan.engine = TRotateEngine::kNearest;
    } else if (format == zm24RGB && (mode == zmrBilinear || mode == zmrBicubic)) {
        plan.engine = TRotateEngine::kInverse;
    } else {
        plan = MakeShearPlan(angle);
    }
    return plan;
}

bool TurnAndShear(TZmBitmap& source, TZmBitmap& target, const TRotatePlan& plan, TColor background,
                  const TResampleListener& listener) {
    if (plan.turns == 0) {
        return RotateByShears(source, target, plan.angle, background, listener);
    }
    TZmBitmap turned;
    TakePlaceSettings(target, turned);
    return TurnQuarters(source, turned, plan.turns) &&
           RotateByShears(turned, target, plan.angle, background, listener);
}

bool RunEngine(TZmBitmap& source, TZmBitmap& target, const TRotatePlan& plan, TColor background,
               const TResampleListener& listener) {
    switch (plan.engine) {
        case TRotateEngine::kQuarters: return TurnQuarters(source, target, plan.turns);
        case TRotateEngine::kInverse:
            return RotateInverse(source, target, plan.angle, plan.mode, background, listener);
        case TRotateEngine::kShears:
            return TurnAndShear(source, target, plan, background, listener);
        case TRotateEngine::kNearest:
            return RotateNearest(source, target, plan.angle, background, listener);
        default: return false;
    }
}

/// Whether the plane can be turned as it is, pixel by pixel below the image.
bool FitsImage(TZmBitmap& plane, TZmBitmap& image) {
    return plane.GetPixelFormat() == zm8g && plane.GetWidth() == image.GetWidth() &&
           plane.GetHeight() == image.GetHeight();
}

/// A copy of a plane in the image's size: planes can outlive a change of the image.
bool CopyFitted(TZmBitmap& plane, TZmBitmap& image, TZmBitmap& copy) {
    TZmBitmap gray;
    gray.AssignEx(&plane, /*with_params=*/false);
    return !gray.IsEmpty() && gray.SetPixelFormat(zm8g) &&
           copy.Allocate(image.GetWidth(), image.GetHeight(), zm8g) && ResampleNearest(gray, copy);
}

/// Gives the turned image the plane of the source, turned the same way. The image's progress has
/// ended already: none is reported here.
bool RotatePlane(TZmBitmap& source, TZmBitmap& target, const TRotatePlan& plan) {
    TZmBitmap* plane = source.GetAlphaChannelRaw();
    if (plane == nullptr || plane->IsEmpty()) {
        return true;
    }
    TZmBitmap fitted;
    if (!FitsImage(*plane, source)) {
        if (!CopyFitted(*plane, source, fitted)) {
            return false;
        }
        plane = &fitted;
    }
    auto turned = std::make_unique<TZmBitmap>();
    TakePlaceSettings(target, *turned);
    if (!RunEngine(*plane, *turned, plan, /*background=*/0, TResampleListener()) ||
        turned->GetWidth() != target.GetWidth() || turned->GetHeight() != target.GetHeight()) {
        return false;
    }
    turned->SyncFull();
    target.ReplaceAlphaChannel(std::move(turned));
    return true;
}

}  // namespace

TRotateOutcome RotateBitmapInto(TZmBitmap& source, TZmBitmap& target, double angle,
                                TZmAntialiasMode mode, TColor background, void* sender,
                                const TZmBitmapProgressEvent& on_progress) {
    if (&source == &target || source.IsEmpty() || source.GetIsVirtual() || !std::isfinite(angle)) {
        return TRotateOutcome::kFailed;
    }
    const TRotatePlan plan = MakePlan(source.GetPixelFormat(), angle, mode);
    if (plan.engine == TRotateEngine::kNone) {
        return TRotateOutcome::kUnchanged;
    }
    try {
        const TResampleListener listener{sender, on_progress};
        const bool is_done = RunEngine(source, target, plan, background, listener) &&
                             RotatePlane(source, target, plan);
        return is_done ? TRotateOutcome::kRotated : TRotateOutcome::kFailed;
    } catch (const std::bad_alloc&) {
        return TRotateOutcome::kFailed;
    }
}

void TZmBitmap::RotateEx(double angle, TZmAntialiasMode mode, TColor background, void* sender,
                         const TZmBitmapProgressEvent& on_progress) {
    if (angle == 0) {
        return;
    }
    TZmBitmap result;
    TakePlaceSettings(*this, result);
    switch (RotateBitmapInto(*this, result, angle, mode, background, sender, on_progress)) {
        case TRotateOutcome::kRotated: TakeOver(result); break;
        case TRotateOutcome::kUnchanged: Changed(); break;
        default: break;
    }
}

void TZmBitmap::Rotate(double angle, TZmAntialiasMode mode, TColor background) {
    RotateEx(angle, mode, background, this, fOnProgress);
}

void TZmBitmap::Rotate(double angle, bool antialias, TZmAntialiasMode mode, TColor background) {
    Rotate(angle, antialias ? mode : zmrNone, background);
}

void TZmBitmap::Flip(TFlipDir direction) {
    if (direction != fdHorizontal && direction != fdVertical) {
        return;
    }
    FlipBitmap(*this, direction);
    Changed();
}

}  // namespace zm
