#pragma once

#include <memory>

#include "engine/platform/clipboard.h"

namespace zm {

/// Formats that programs agree on by name. They are registered when the program or module is
/// loaded, PNG when it is first needed.
platform::TClipboardFormat ClipboardRawFormat();
platform::TClipboardFormat ClipboardLayerFormat();
platform::TClipboardFormat ClipboardPngFormat();

/// The clipboard, tried up to 10 times with a pause of 20 milliseconds between tries, since other
/// programs may hold it; nil when it cannot be opened.
std::unique_ptr<platform::TClipboard> OpenClipboardPatiently();

}  // namespace zm
