#pragma once

#include <cstdint>
#include <string>

#include "engine/foundation/zmdefs.h"
#include "engine/io/zmfiletypes.h"

namespace zm {

class TStream;

/// The operations of the driver for one format each, over the few that do the work for a type
/// given by number. Results and failures are those of the driver (TZalmoIO): true or the count of
/// images on success, false or -1 on failure. A format without a codec, and all that needs a
/// view, video or a screen, fails.
class TZmIOFormats {
public:
    using TName = std::u16string;

    bool LoadFromFileBMP(const TName& name) { return LoadFileAs(ioBMP, name); }
    bool LoadFromStreamBMP(TStream& stream) { return LoadStreamAs(ioBMP, stream); }
    bool SaveToFileBMP(const TName& name) { return SaveFileAs(ioBMP, name); }
    bool SaveToStreamBMP(TStream& stream) { return SaveStreamAs(ioBMP, stream); }

    /// Headerless pixels as the BMPRAW parameters describe them.
    bool LoadFromFileBMPRAW(const TName& name) { return LoadFileAs(ioBMPRAW, name); }
    bool LoadFromStreamBMPRAW(TStream& stream) { return LoadStreamAs(ioBMPRAW, stream); }
    bool SaveToFileBMPRAW(const TName& name) { return SaveFileAs(ioBMPRAW, name); }
    bool SaveToStreamBMPRAW(TStream& stream) { return SaveStreamAs(ioBMPRAW, stream); }

    bool LoadFromFileJpeg(const TName& name) { return LoadFileAs(ioJPEG, name); }
    bool LoadFromStreamJpeg(TStream& stream) { return LoadStreamAs(ioJPEG, stream); }
    bool SaveToFileJpeg(const TName& name) { return SaveFileAs(ioJPEG, name); }
    bool SaveToStreamJpeg(TStream& stream) { return SaveStreamAs(ioJPEG, stream); }

    /// Loads give the count of frames. Insert adds a frame at the image index, Replace exchanges
    /// the one there.
    std::int32_t LoadFromFileGIF(const TName& name) { return CountFile(ioGIF, name); }
    std::int32_t LoadFromStreamGIF(TStream& stream) { return CountStream(ioGIF, stream); }
    bool SaveToFileGIF(const TName& name) { return SaveFileAs(ioGIF, name); }
    bool SaveToStreamGIF(TStream& stream) { return SaveStreamAs(ioGIF, stream); }
    std::int32_t InsertToFileGIF(const TName&) { return RefuseCount(); }
    bool ReplaceFileGIF(const TName&) { return Refuse(); }

    bool LoadFromFilePCX(const TName& name) { return LoadFileAs(ioPCX, name); }
    bool LoadFromStreamPCX(TStream& stream) { return LoadStreamAs(ioPCX, stream); }
    bool SaveToFilePCX(const TName& name) { return SaveFileAs(ioPCX, name); }
    bool SaveToStreamPCX(TStream& stream) { return SaveStreamAs(ioPCX, stream); }

    bool LoadFromFileDCX(const TName& name) { return LoadFileAs(ioDCX, name); }
    bool LoadFromStreamDCX(TStream& stream) { return LoadStreamAs(ioDCX, stream); }
    bool SaveToFileDCX(const TName& name) { return SaveFileAs(ioDCX, name); }
    bool SaveToStreamDCX(TStream& stream) { return SaveStreamAs(ioDCX, stream); }
    bool InsertToFileDCX(const TName&) { return Refuse(); }

    /// Loads give the count of pages.
    std::int32_t LoadFromFileTIFF(const TName& name) { return CountFile(ioTIFF, name); }
    std::int32_t LoadFromStreamTIFF(TStream& stream) { return CountStream(ioTIFF, stream); }
    bool SaveToFileTIFF(const TName& name) { return SaveFileAs(ioTIFF, name); }
    bool SaveToStreamTIFF(TStream& stream) { return SaveStreamAs(ioTIFF, stream); }
    std::int32_t InsertToFileTIFF(const TName&) { return RefuseCount(); }
    std::int32_t InsertToStreamTIFF(TStream&) { return RefuseCount(); }
    bool ReplaceFileTIFF(const TName&) { return Refuse(); }
    bool ReplaceStreamTIFF(TStream&) { return Refuse(); }
    bool InjectTIFFEXIF(const TName&) { return Refuse(); }

    bool LoadFromFilePNG(const TName& name) { return LoadFileAs(ioPNG, name); }
    bool LoadFromStreamPNG(TStream& stream) { return LoadStreamAs(ioPNG, stream); }
    bool SaveToFilePNG(const TName& name) { return SaveFileAs(ioPNG, name); }
    bool SaveToStreamPNG(TStream& stream) { return SaveStreamAs(ioPNG, stream); }

    bool LoadFromFileTGA(const TName& name) { return LoadFileAs(ioTGA, name); }
    bool LoadFromStreamTGA(TStream& stream) { return LoadStreamAs(ioTGA, stream); }
    bool SaveToFileTGA(const TName& name) { return SaveFileAs(ioTGA, name); }
    bool SaveToStreamTGA(TStream& stream) { return SaveStreamAs(ioTGA, stream); }

    bool LoadFromFilePXM(const TName& name) { return LoadFileAs(ioPXM, name); }
    bool LoadFromStreamPXM(TStream& stream) { return LoadStreamAs(ioPXM, stream); }
    bool SaveToFilePXM(const TName& name) { return SaveFileAs(ioPXM, name); }
    bool SaveToStreamPXM(TStream& stream) { return SaveStreamAs(ioPXM, stream); }

    /// A save without sizes in the parameters takes the bitmap's.
    bool LoadFromFileICO(const TName& name) { return LoadFileAs(ioICO, name); }
    bool LoadFromStreamICO(TStream& stream) { return LoadStreamAs(ioICO, stream); }
    bool SaveToFileICO(const TName& name) { return SaveFileAs(ioICO, name); }
    bool SaveToStreamICO(TStream& stream) { return SaveStreamAs(ioICO, stream); }
    bool LoadFromFileCUR(const TName& name) { return LoadFileAs(ioCUR, name); }
    bool LoadFromStreamCUR(TStream& stream) { return LoadStreamAs(ioCUR, stream); }

    bool LoadFromFileWBMP(const TName& name) { return LoadFileAs(ioWBMP, name); }
    bool LoadFromStreamWBMP(TStream& stream) { return LoadStreamAs(ioWBMP, stream); }
    bool SaveToFileWBMP(const TName& name) { return SaveFileAs(ioWBMP, name); }
    bool SaveToStreamWBMP(TStream& stream) { return SaveStreamAs(ioWBMP, stream); }

    bool LoadFromFileDICOM(const TName& name) { return LoadFileAs(ioDICOM, name); }
    bool LoadFromStreamDICOM(TStream& stream) { return LoadStreamAs(ioDICOM, stream); }
    bool SaveToFileDICOM(const TName& name) { return SaveFileAs(ioDICOM, name); }
    bool SaveToStreamDICOM(TStream& stream) { return SaveStreamAs(ioDICOM, stream); }

    bool LoadFromFileJP2(const TName& name) { return LoadFileAs(ioJP2, name); }
    bool LoadFromStreamJP2(TStream& stream) { return LoadStreamAs(ioJP2, stream); }
    bool SaveToFileJP2(const TName& name) { return SaveFileAs(ioJP2, name); }
    bool SaveToStreamJP2(TStream& stream) { return SaveStreamAs(ioJP2, stream); }
    bool LoadFromFileJ2K(const TName& name) { return LoadFileAs(ioJ2K, name); }
    bool LoadFromStreamJ2K(TStream& stream) { return LoadStreamAs(ioJ2K, stream); }
    bool SaveToFileJ2K(const TName& name) { return SaveFileAs(ioJ2K, name); }
    bool SaveToStreamJ2K(TStream& stream) { return SaveStreamAs(ioJ2K, stream); }

    /// A name that ends in .psb selects the large document form on save.
    bool LoadFromFilePSD(const TName& name) { return LoadFileAs(ioPSD, name); }
    bool LoadFromStreamPSD(TStream& stream) { return LoadStreamAs(ioPSD, stream); }
    bool SaveToFilePSD(const TName& name) { return SaveFileAs(ioPSD, name); }
    bool SaveToStreamPSD(TStream& stream) { return SaveStreamAs(ioPSD, stream); }

    /// Through the platform's imaging component.
    bool LoadFromFileHDP(const TName& name) { return LoadFromFileWIC(name, ioHDP); }
    bool LoadFromStreamHDP(TStream& stream) { return LoadFromStreamWIC(stream, ioHDP); }
    bool SaveToFileHDP(const TName& name) { return SaveToFileWIC(name, ioHDP); }
    bool SaveToStreamHDP(TStream& stream) { return SaveToStreamWIC(stream, ioHDP); }
    bool LoadFromFileWIC(const TName& name, std::int32_t type) { return LoadFileAs(type, name); }
    bool LoadFromStreamWIC(TStream& stream, std::int32_t type) {
        return LoadStreamAs(type, stream);
    }
    bool SaveToFileWIC(const TName& name, std::int32_t type) { return SaveFileAs(type, name); }
    bool SaveToStreamWIC(TStream& stream, std::int32_t type) { return SaveStreamAs(type, stream); }

    bool LoadFromFileRAW(const TName& name) { return LoadFileAs(ioRAW, name); }
    bool LoadFromStreamRAW(TStream& stream) { return LoadStreamAs(ioRAW, stream); }

    /// Pages one by one: Create opens the document, Save adds the bitmap as a page, Close ends it.
    bool SaveToFilePS(const TName& name) { return SaveFileAs(ioPS, name); }
    bool SaveToStreamPS(TStream& stream) { return SaveStreamAs(ioPS, stream); }
    bool CreatePSFile(const TName&) { return Refuse(); }
    bool SaveToPS() { return Refuse(); }
    bool ClosePSFile() { return Refuse(); }
    /// Loads need a plug-in row; it finds the wanted size and the password in the parameters'
    /// fDict under "PDF:DesiredWidth", "PDF:DesiredHeight" and "PDF:Password".
    bool LoadFromFilePDF(const TName& name) { return LoadFileAs(kPluginPdfType, name); }
    bool LoadFromStreamPDF(TStream& stream) { return LoadStreamAs(kPluginPdfType, stream); }
    bool SaveToFilePDF(const TName& name) { return SaveFileAs(ioPDF, name); }
    bool SaveToStreamPDF(TStream& stream) { return SaveStreamAs(ioPDF, stream); }
    bool CreatePDFFile(const TName&) { return Refuse(); }
    bool SaveToPDF() { return Refuse(); }
    bool ClosePDFFile() { return Refuse(); }

    /// Layers belong to a view. Saving to a file without one raises EZmException.
    bool LoadFromFileZMN(const TName& name) { return LoadFileAs(ioLYR, name); }
    bool LoadFromStreamZMN(TStream& stream) { return LoadStreamAs(ioLYR, stream); }
    bool SaveToFileZMN(const TName&) {
        throw EZmException("Must be attached to a TZalmoView to save in ZMN format");
    }
    bool SaveToStreamZMN(TStream& stream) { return SaveStreamAs(ioLYR, stream); }
    bool SaveToFileSVG(const TName& name) { return SaveFileAs(ioSVG, name); }
    bool SaveToStreamSVG(TStream& stream) { return SaveStreamAs(ioSVG, stream); }

    // Video and the screen: there is no player and no screen behind this engine.
    bool OpenAVIFile(const TName&) { return Refuse(); }
    bool LoadFromAVI(std::int32_t) { return Refuse(); }
    void CloseAVIFile() {}
    bool IsOpenAVI() const { return false; }
    bool CreateAVIFile(const TName&, double, const std::string&, const TName&) { return Refuse(); }
    bool SaveToAVI() { return Refuse(); }
    bool OpenMediaFile(const TName&) { return Refuse(); }
    bool LoadFromMediaFile(std::int32_t) { return Refuse(); }
    void CloseMediaFile() {}
    bool IsOpenMediaFile() const { return false; }
    bool CaptureFromScreen() { return Refuse(); }
    bool LoadThumbnailFromExplorer(const TName&) { return Refuse(); }
    bool Acquire() { return Refuse(); }
    /// Shows the parameters of a file type with a preview. There is no such dialog here.
    virtual bool DoPreviews() { return Refuse(); }

protected:
    ~TZmIOFormats() = default;
    virtual bool LoadFileAs(std::int32_t type, const TName& name) = 0;
    virtual bool LoadStreamAs(std::int32_t type, TStream& stream) = 0;
    virtual bool SaveFileAs(std::int32_t type, const TName& name) = 0;
    virtual bool SaveStreamAs(std::int32_t type, TStream& stream) = 0;
    /// The same as a count of images; -1 on failure, and at once from a load on a thread.
    virtual std::int32_t CountFile(std::int32_t type, const TName& name) = 0;
    virtual std::int32_t CountStream(std::int32_t type, TStream& stream) = 0;
    /// Fails without having tried.
    virtual bool Refuse() = 0;
    std::int32_t RefuseCount() {
        Refuse();
        return -1;
    }
};

}  // namespace zm
