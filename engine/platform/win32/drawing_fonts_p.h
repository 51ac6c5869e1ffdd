#pragma once

#include "engine/platform/drawing.h"

#include <windows.h>

// A macro of the system's header by which it would rename the canvas's own operation.
#undef TextOut

namespace zm::platform {

/// Whether the plain drawing or the library asks for the font; the plain one has no coverage.
enum class TFontUse : std::uint8_t { kPlain, kVector };

/// The system's font nearest to the description; the caller deletes it. Nil without room.
HFONT MakeSystemFont(const TDrawFont& font, TFontUse use);

/// An object of the device context for a scope; the old one comes back, this one is deleted.
class TSelectedObject {
public:
    TSelectedObject(HDC context, HGDIOBJ object)
        : context_(context),
          object_(object),
          previous_(object != nullptr ? ::SelectObject(context, object) : nullptr) {}
    ~TSelectedObject() {
        if (previous_ != nullptr) {
            ::SelectObject(context_, previous_);
        }
        if (object_ != nullptr) {
            ::DeleteObject(object_);
        }
    }
    TSelectedObject(const TSelectedObject&) = delete;
    TSelectedObject& operator=(const TSelectedObject&) = delete;
    bool IsSelected() const { return previous_ != nullptr; }

private:
    HDC context_;
    HGDIOBJ object_;
    HGDIOBJ previous_;
};

}  // namespace zm::platform
