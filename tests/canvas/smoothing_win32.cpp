#include "tests/canvas/drawing.h"

namespace zm::test {

/// The system's own library gives shapes coverage; a stand-in for it may draw whole pixels.
bool ShapesHaveCoverage() {
    static const bool has_coverage = [] {
        TDrawing drawing(10, 10);
        drawing.zm_canvas->DrawLine(0, 4.5, 10, 4.5);
        const int alpha = drawing.PixelAt(5, 4).a;
        return alpha > 0 && alpha < 255;
    }();
    return has_coverage;
}

}  // namespace zm::test
