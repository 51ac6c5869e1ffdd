#include "tests/canvas/drawing.h"

namespace zm::test {

bool ShapesHaveCoverage() {
    return true;
}

}  // namespace zm::test
