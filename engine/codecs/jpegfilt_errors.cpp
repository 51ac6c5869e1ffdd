// Errors and warnings of the JPEG library: their stable numbers, their texts, and the way out of
// the library's C code, through which no C++ exception may pass.

#include <jerror.h>

#include <array>
#include <cctype>

#include "engine/codecs/jpegfilt.h"
#include "engine/codecs/jpegfilt_p.h"

namespace zm {

namespace {

/// Place of "Invalid crop request" in the stable numbering; the linked library has it behind the
/// others, all else keeps its order.
constexpr std::int32_t kCropMessage = 6;

static_assert(JERR_BAD_COMPONENT_ID == kCropMessage - 1 && JERR_BAD_DCT_COEF == kCropMessage);
static_assert(JERR_TOO_LITTLE_DATA + 1 == kJpegTooFewRows);
static_assert(JWRN_TOO_MUCH_DATA == kJpegMessageCount - 2);
static_assert(JERR_BAD_CROP_SPEC > JWRN_TOO_MUCH_DATA);

int LibraryCode(std::int32_t number) {
    if (number == kCropMessage) {
        return JERR_BAD_CROP_SPEC;
    }
    return number < kCropMessage ? number : number - 1;
}

/// "%d" and its kin become "?".
std::string WithoutParameters(const char* format) {
    std::string text;
    for (const char* c = format; *c != '\0'; ++c) {
        if (*c != '%') {
            text += *c;
            continue;
        }
        text += '?';
        do {
            ++c;
        } while (std::isdigit(static_cast<unsigned char>(*c)) != 0);
        if (*c == '\0') {
            break;
        }
    }
    return text;
}

using TMessageTable = std::array<std::string, kJpegMessageCount>;

TMessageTable MakeMessageTable() {
    jpeg_error_mgr manager = {};
    jpeg_std_error(&manager);
    TMessageTable table;
    for (std::int32_t number = 0; number < kJpegMessageCount; ++number) {
        const int code = LibraryCode(number);
        const char* format =
            code <= manager.last_jpeg_message ? manager.jpeg_message_table[code] : nullptr;
        if (format != nullptr) {
            table[static_cast<std::size_t>(number)] = WithoutParameters(format);
        }
    }
    return table;
}

TJpegErrors& ErrorsOf(j_common_ptr library) {
    return *reinterpret_cast<TJpegErrors*>(library->err);
}

[[noreturn]] void LeaveLibrary(j_common_ptr library) {
    TJpegErrors& errors = ErrorsOf(library);
    errors.fatal_code = errors.base.msg_code;
    std::longjmp(errors.jump, 1);
}

/// Data that a decoder misses behind the end of the source are a failure; other damage is a
/// warning. Trace messages have levels from 0.
void CountWarning(j_common_ptr library, int level) {
    TJpegErrors& errors = ErrorsOf(library);
    if (level >= 0) {
        return;
    }
    if (errors.input_ended && errors.base.msg_code == JWRN_HIT_MARKER) {
        LeaveJpegLibrary(library, JERR_INPUT_EOF);
    }
    ++errors.warning_total;
    errors.warning_number = JpegMessageNumber(errors.base.msg_code);
}

void IgnoreOutput(j_common_ptr) {}

}  // namespace

std::int32_t JpegMessageNumber(int library_code) {
    if (library_code == JERR_BAD_CROP_SPEC) {
        return kCropMessage;
    }
    const bool moves_up = library_code >= kCropMessage && library_code <= JWRN_TOO_MUCH_DATA;
    return moves_up ? library_code + 1 : library_code;
}

std::string JpegMessageText(std::int32_t number) {
    static const TMessageTable table = MakeMessageTable();
    if (number < 0 || number >= kJpegMessageCount) {
        return "Corrupted";
    }
    return table[static_cast<std::size_t>(number)];
}

jpeg_error_mgr* InitJpegErrors(TJpegErrors& errors) {
    jpeg_std_error(&errors.base);
    errors.base.error_exit = LeaveLibrary;
    errors.base.emit_message = CountWarning;
    errors.base.output_message = IgnoreOutput;
    return &errors.base;
}

void RaiseJpegError(const TJpegErrors& errors) {
    const std::int32_t number = JpegMessageNumber(errors.fatal_code);
    if (number != kJpegTooFewRows) {
        throw EZmJpegException(JpegMessageText(number));
    }
}

void LeaveJpegLibrary(j_common_ptr library, int code) {
    library->err->msg_code = code;
    LeaveLibrary(library);
}

}  // namespace zm
