#include <algorithm>

#include "actions/uActionFormModel.h"
#include "actions/uImageList.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfileformats.h"

namespace zm {
namespace {

bool IsSaveFormat(std::int32_t file_type) {
    for (std::int32_t index = 0; const TSaveFormat* format = SaveFormatAt(index); ++index) {
        if (format->file_type == file_type) {
            return true;
        }
    }
    return false;
}

bool IsOffered(const TZmFileFormatInfo& row, TFilePick pick) {
    return pick == fpOpen ? row.ReadFunction != nullptr : IsSaveFormat(row.FileType);
}

}  // namespace

std::vector<TFileFilter> ImageFileFilters(TFilePick pick) {
    TFileFilter images{u"Image files", {}};
    for (const auto& row : ZmGlobalSettings().fFileFormats) {
        if (!IsOffered(*row, pick)) {
            continue;
        }
        for (const std::string& extension : SplitText(AsciiLower(row->Extensions), ';')) {
            const std::u16string wide = Utf16FromUtf8(extension);
            const auto end = images.extensions.end();
            if (!wide.empty() && std::find(images.extensions.begin(), end, wide) == end) {
                images.extensions.push_back(wide);
            }
        }
    }
    return {images, {u"All files", {}}};
}

}  // namespace zm
