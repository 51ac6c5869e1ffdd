#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmfieldstreams.h"
#include "engine/io/zmioparams_blocks.h"
#include "engine/io/zmioparams_fields_p.h"
#include "engine/io/zmioparams_types_p.h"

// The stream form of the parameters: magic, version, dictionary text, EXIF block, fields.
namespace zm {

namespace {

constexpr std::string_view kMagic = "ZMIOPARAMSMAGIC";
constexpr std::int32_t kVersion = 91;
constexpr std::int32_t kFirstVersionWithDictionary = 51;
constexpr std::int32_t kFirstVersionWithExif = 43;
constexpr std::int32_t kBufferBytes = 8192;

void CheckMagic(TZmFieldReader& reader) {
    std::string magic;
    const std::int32_t length = reader.S32();
    if (length == static_cast<std::int32_t>(kMagic.size())) {
        magic.resize(kMagic.size());
        reader.ReadBytes(magic.data(), magic.size());
    }
    if (magic != kMagic) {
        throw EZmException(
            "Invalid TIOParams stream. You cannot use TIOParams.LoadFromStream or LoadFromFile "
            "to load parameters from image files.");
    }
}

}  // namespace

void TIOParams::SaveToFile(const std::u16string& file_name) {
    TZmSaveFileStream file(file_name);
    SaveToStream(file);
    if (!file.Commit()) {
        throw EWriteError("Stream write error");
    }
}

void TIOParams::SaveToStream(TStream& stream) {
    TMemoryStream bytes;  // the target sees one whole write, or none when the form cannot be made
    TZmFieldWriter writer(bytes);
    writer.WriteText(kMagic);
    writer.S32(kVersion);
    writer.WriteWideText(fDict.Dump(zmplJSON));
    kBlockFieldTypes[kBlockExif].save(this, writer);
    for (const TZmIOField& field : TZmIOFieldTable::Stored()) {
        field.type->save(field.address(*this), writer);
    }
    stream.WriteBuffer(bytes.Bytes().data(), bytes.Bytes().size());
}

void TIOParams::LoadFromFile(const std::u16string& file_name, bool check_magic) {
    TFileStream file(file_name, fmOpenRead);
    LoadFromStream(file, check_magic);
}

void TIOParams::LoadFromStream(TStream& stream, bool check_magic) {
    TZmBufferedReadStream buffered(&stream, kBufferBytes, /*use_relative_position=*/false);
    TZmFieldReader reader(buffered);
    if (check_magic) {
        CheckMagic(reader);
    }
    LoadFields(reader);
}

void TIOParams::LoadFields(TZmFieldReader& reader) {
    TIOParams defaults;
    const std::int32_t version = reader.S32();
    fDict.Clear();
    if (version >= kFirstVersionWithDictionary) {
        std::u16string text;
        if (reader.ReadWideText(text)) {
            fDict.Parse(text);
        }
    }
    if (version >= kFirstVersionWithExif) {
        kBlockFieldTypes[kBlockExif].load(this, reader);
    }
    for (const TZmIOField& field : TZmIOFieldTable::Stored()) {
        field.type->assign(field.address(*this), field.address(defaults));
        if (version >= field.since && !reader.HasFailed()) {
            field.type->load(field.address(*this), reader);
        }
    }
    if (ParamsBlockHook(kBlockExif).load == nullptr) {
        SetDpiX(fDpiX);  // no EXIF block told a resolution of its own
        SetDpiY(fDpiY);
    }
}

}  // namespace zm
