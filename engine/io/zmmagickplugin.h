#pragma once

namespace zm {

/// Optional plug-in: further file types through the ImageMagick libraries, bound at run time where
/// they are installed. The engine itself never registers it; an embedding program may, during
/// set-up, before any thread loads. The libraries' own policy decides what of a format is allowed.
class TZmMiscPluginsImageMagick {
public:
    /// Whether the libraries are installed and usable. The first call loads them; they stay.
    static bool IsAvailable();
    /// Appends a row for each type of the plug-in's table and removes the rows of PDF and
    /// PostScript, which the table has its own of. The PDF row is left out where another plug-in
    /// has registered one. False, and nothing changed, without the libraries.
    static bool RegisterPlugin();
};

}  // namespace zm
