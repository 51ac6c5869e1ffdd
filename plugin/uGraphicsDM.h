#pragma once

#include <cstdint>
#include <string>

#include "plugin/AFPlugin.h"
#include "plugin/uQVPluginUtils.h"

namespace zm {

/// The actions by their index, the number that the host passes.
enum TGraphicsAction : std::int32_t {
    gaOpenImage,
    gaSaveImage,
    gaResizeImage,
    gaCropImage,
    gaRotateImage,
    gaTextOnImage,
    gaImageOnImage,
    gaAddBorder,
};
inline constexpr std::int32_t kGraphicsActionCount = 8;

/// The data module: declares the plug-in with its eight actions and routes the host's calls to
/// each action's own functions by the action's index. The index lookup and the parameters of a
/// call are all the state that routing has, so that jobs may run side by side. Exceptions of the
/// actions pass through.
class TDM {
public:
    /// Makes the declaration; the engine's library is in use from here on.
    TDM();
    ~TDM();
    TDM(const TDM&) = delete;
    TDM& operator=(const TDM&) = delete;

    /// Initialises the component and reads what the host's window tells. Returns the plug-in's
    /// record, valid as long as the object.
    TAFPluginInfo* Init(const TAFAppInfo& app_info);

    // Handlers of all actions.
    /// Runs the step: -1 or 0.
    TLongBool ActionExec(TAction* sender, TAFActionParams& params);
    /// Shows the action's form; when confirmed, writes the settings back into the host's block.
    /// When the user cancels, and when no form can be shown (the host's log then tells why), the
    /// answer is 0 and the block stays as it is.
    TLongBool ActionConfig(TAction* sender, TAFActionParams& params);
    void ActionDescr(TAction* sender, TAFActionParams& params, std::u16string& Descr);
    /// Nothing belongs to a stored step: deleting one changes no image.
    void ActionDelete(TAction* sender, TAFActionParams& params);
    /// Required: only the Open Image step ends the job's image, the one place that owns it.
    void TaskStop(TAction* sender, TAFActionParams& params);
    /// Ends the use of the engine's library; the image list stays until the module goes.
    void PluginShutdownPlugin();

    TAFPlugin Plugin;
    TQVPluginSettings Settings;

private:
    void DeclareActions();

    bool library_in_use_ = true;
};

/// The entry's work: makes the process's data module and, when the host's version is 8.3 or
/// later, initialises it. Nil for an older host and for a nil record. A later call raises
/// EPluginException once a host was accepted.
TAFPluginInfo* StartPlugin(const TAFAppInfo* app_info);

}  // namespace zm
