#include "plugin/uGraphicsDM.h"

#include <array>
#include <memory>
#include <vector>

#include "actions/uActionDescriptions.h"
#include "actions/uActionFormModel.h"
#include "actions/uImageList.h"
#include "engine/foundation/zmsettings.h"
#include "engine/platform/process.h"
#include "plugin/AFPlugin_p.h"
#include "plugin/uVersionCompare.h"

namespace zm {
namespace {

constexpr std::int32_t kPluginID = 550383872;
constexpr char16_t kMinHostVersion[] = u"8.3";

/// The actions' view of the host, over the process-wide component.
class THostServices : public IHostServices {
public:
    void* GetMemory(std::int32_t size_bytes) override {
        void* block = nullptr;
        HostGetMemory(&block, size_bytes);
        return block;
    }
    void FreeMemory(void* block, std::int32_t size_bytes) override {
        HostFreeMemory(&block, size_bytes);
    }
    void ExpandText(const char16_t* text, char16_t* buffer, std::int32_t* size_bytes,
                    std::int32_t* status) override {
        HostExpandText(text, buffer, size_bytes, status);
    }
    void SelectVar(char16_t* buffer, std::int32_t max_length) override {
        HostSelectVar(buffer, max_length);
    }
    void InfoOut(std::int32_t kind, const std::u16string& line) override {
        HostInfoOut(kind, line.c_str());
    }
    void SetLastError(std::int32_t job_id, std::int32_t code, const std::u16string& text) override {
        HostSetLastError(job_id, code, text.c_str());
    }
    std::int32_t DefaultScale() const override { return Component().DefaultScale(); }
    void* MainWindow() const override { return Component().GetAppInfo().WHandle; }

private:
    static const TAFPlugin& Component() {
        const TAFPlugin* plugin = PluginInstance();
        if (plugin == nullptr) {
            throw EPluginException("The plug-in has not been initialised by a host");
        }
        return *plugin;
    }
};
THostServices host_services;

// The three functions of each action are its operation, its form and its description.
struct TActionRow {
    const char16_t* name;
    const char16_t* id;
    TIconGlyph glyph;
    bool (TQVImageList::*execute)(const IStepParams& params);
    const TActionFormDesign& (*form)();
    void (*describe)(const IStepParams& params, std::u16string& Descr);
};

constexpr std::array<TActionRow, kGraphicsActionCount> kActionRows{{
    {u"Open Image", u"A_GRAPHICS_OPEN_IMAGE", igOpen, &TQVImageList::Open, &OpenImageForm,
     &DescribeOpenImage},
    {u"Save Image", u"A_GRAPHICS_SAVE_IMAGE", igSave, &TQVImageList::Save, &SaveImageForm,
     &DescribeSaveImage},
    {u"Resize Image", u"A_GRAPHICS_RESIZE_IMAGE", igResize, &TQVImageList::Resize, &ResizeImageForm,
     &DescribeResizeImage},
    {u"Crop Image", u"A_GRAPHICS_CROP_IMAGE", igCrop, &TQVImageList::Crop, &CropImageForm,
     &DescribeCropImage},
    {u"Rotate Image", u"A_GRAPHICS_ROTATE_IMAGE", igRotate, &TQVImageList::Rotate, &RotateImageForm,
     &DescribeRotateImage},
    {u"Draw Text on Image", u"A_GRAPHICS_DRAW_TEXT_ON_IMAGE", igText, &TQVImageList::TextOut,
     &TextOnImageForm, &DescribeTextOnImage},
    {u"Draw Image on Image", u"A_GRAPHICS_DRAW_IMAGE_ON_IMAGE", igImage, &TQVImageList::DrawImage,
     &ImageOnImageForm, &DescribeImageOnImage},
    {u"Add Border to Image", u"A_GRAPHICS_ADD_BORDER_TO_IMAGE", igBorder, &TQVImageList::AddBorder,
     &AddBorderForm, &DescribeAddBorder},
}};

/// Row of an item of the collection; nil for an index outside the table.
const TActionRow* RowOf(const TAction& action) {
    const std::int32_t index = action.GetIndex();
    return index < kGraphicsActionCount ? &kActionRows[static_cast<std::size_t>(index)] : nullptr;
}

/// The data modules of the process, the last being the present one. Earlier ones stay: the host
/// may hold the record of the one that it accepted. When the module is unloaded they give their
/// records back to the host; when the whole process ends, the host's heap may be gone before us,
/// and everything goes with the process.
struct TDataModules {
    TDataModules() = default;
    TDataModules(const TDataModules&) = delete;
    TDataModules& operator=(const TDataModules&) = delete;
    ~TDataModules() {
        for (std::unique_ptr<TDM>& module : modules) {
            if (platform::ProcessIsEnding()) {
                static_cast<void>(module.release());
            }
        }
    }

    std::vector<std::unique_ptr<TDM>> modules;
};

TDataModules& DataModules() {
    static TDataModules data_modules;
    return data_modules;
}

}  // namespace

TDM::TDM() {
    ZmInitializeLibrary();
    Plugin.SetDescription(u"Graphics");
    Plugin.SetID(kPluginID);
    Plugin.GetIcon().LoadFromFileImage(BuildIconFile(igPlugin));
    Plugin.OnShutdownPlugin = [this] { PluginShutdownPlugin(); };
    DeclareActions();
}

TDM::~TDM() {
    PluginShutdownPlugin();
}

void TDM::DeclareActions() {
    for (const TActionRow& row : kActionRows) {
        TAction& action = Plugin.GetActions().Add();
        action.SetName(row.name);
        action.SetID(row.id);
        action.GetIcon().LoadFromFileImage(BuildIconFile(row.glyph));
        action.OnExecAction = [this](TAction* sender, TAFActionParams& params) {
            return ActionExec(sender, params);
        };
        action.OnConfigAction = [this](TAction* sender, TAFActionParams& params) {
            return ActionConfig(sender, params);
        };
        action.OnActionDescr = [this](TAction* sender, TAFActionParams& params,
                                      std::u16string& Descr) {
            ActionDescr(sender, params, Descr);
        };
        action.OnActionDelete = [this](TAction* sender, TAFActionParams& params) {
            ActionDelete(sender, params);
        };
        action.OnJobStop = [this](TAction* sender, TAFActionParams& params) {
            TaskStop(sender, params);
        };
    }
}

TAFPluginInfo* TDM::Init(const TAFAppInfo& app_info) {
    TAFPluginInfo* plugin_info = Plugin.Initialize(app_info);
    InstallHostServices(&host_services);
    ReadPluginSettings(Settings, Plugin);
    return plugin_info;
}

TLongBool TDM::ActionExec(TAction* sender, TAFActionParams& params) {
    const TQVPluginParams step(params);
    const TActionRow* row = RowOf(*sender);
    const bool done = row != nullptr && (GetImageList().*row->execute)(step);
    return done ? kLongTrue : kLongFalse;
}

TLongBool TDM::ActionConfig(TAction* sender, TAFActionParams& params) {
    TQVPluginParams step(params);
    const TActionRow* row = RowOf(*sender);
    if (row == nullptr || !ConfigureStep(row->form(), step)) {
        return kLongFalse;
    }
    step.ToActionParams(params);
    return kLongTrue;
}

void TDM::ActionDescr(TAction* sender, TAFActionParams& params, std::u16string& Descr) {
    const TQVPluginParams step(params);
    if (const TActionRow* row = RowOf(*sender)) {
        row->describe(step, Descr);
    }
}

void TDM::ActionDelete(TAction*, TAFActionParams&) {}

void TDM::TaskStop(TAction* sender, TAFActionParams& params) {
    if (sender->GetIndex() == gaOpenImage) {
        GetImageList().Close(TQVPluginParams(params));
    }
}

void TDM::PluginShutdownPlugin() {
    if (library_in_use_) {
        library_in_use_ = false;
        ZmFinalizeLibrary();
    }
}

TAFPluginInfo* StartPlugin(const TAFAppInfo* app_info) {
    auto created = std::make_unique<TDM>();
    TDM& data_module = *created;
    DataModules().modules.push_back(std::move(created));
    if (app_info == nullptr || app_info->Ver == nullptr ||
        CompareVersions(app_info->Ver, kMinHostVersion) < 0) {
        return nullptr;
    }
    return data_module.Init(*app_info);
}

}  // namespace zm
