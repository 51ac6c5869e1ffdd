// C++ exceptions and operating-system exceptions on 32-bit Windows. The two do not know each
// other here: our compiler unwinds by tables of its own, other compilers by the chain of
// registrations that starts at fs:[0].
#include "engine/platform/hostboundary.h"

#include <windows.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <exception>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

static_assert(sizeof(void*) == 4, "the registration chain exists on 32-bit Windows only");

constexpr std::size_t kMessageCapacity = 2048;  // characters, the zero included
constexpr std::size_t kJumpWords = 5;           // of the compiler's jump buffer

/// Text of a failure in plain memory, because nobody runs destructors when a host's handler
/// unwinds our frames.
struct TMessage {
    std::array<char16_t, kMessageCapacity> text{};
    std::size_t length = 0;

    void Set(std::u16string_view source) {
        length = std::min(source.size(), kMessageCapacity - 1);
        std::copy_n(source.begin(), length, text.begin());
        text[length] = u'\0';
    }
};

thread_local TMessage thread_message;

/// Runs `body`; true when a C++ exception came out, whose message then stands in `message`. All
/// clean-up of that exception has run when this returns.
bool FailsWithMessage(const std::function<void()>& body, TMessage& message) {
    try {
        body();
        return false;
    } catch (const std::exception& error) {
        message.Set(Utf16FromUtf8(error.what()));
    } catch (...) {
        message.Set(u"unknown exception");
    }
    return true;
}

struct TCatchFrame;

using THandler = EXCEPTION_DISPOSITION(__cdecl*)(EXCEPTION_RECORD*, TCatchFrame*, CONTEXT*, void*);

/// An entry of the thread's chain of handlers. The system reads the first two fields.
struct TCatchFrame {
    void* previous = nullptr;
    THandler handler = nullptr;
    std::array<void*, kJumpWords> jump{};
    TMessage* message = nullptr;
};

void* ChainHead() {
    void* head = nullptr;
    asm volatile("movl %%fs:0, %0" : "=r"(head) : : "memory");
    return head;
}

void SetChainHead(void* head) {
    asm volatile("movl %0, %%fs:0" : : "r"(head) : "memory");
}

/// The text of an operating-system exception: that of one of ours, or its code.
void DescribeException(const EXCEPTION_RECORD& record, TMessage& message) {
    if (record.ExceptionCode == kHostExceptionCode && record.NumberParameters >= 2) {
        const auto* const text = reinterpret_cast<const char16_t*>(record.ExceptionInformation[0]);
        message.Set({text, static_cast<std::size_t>(record.ExceptionInformation[1])});
        return;
    }
    static constexpr char16_t kDigits[] = u"0123456789ABCDEF";
    std::array<char16_t, 8> code{};
    for (std::size_t i = 0; i < code.size(); ++i) {
        code[i] = kDigits[(record.ExceptionCode >> (28 - 4 * i)) & 15];
    }
    message.Set(u"exception " + std::u16string(code.begin(), code.end()));
}

/// Takes every exception: unwinds the chain to our entry and jumps into the function that made
/// it. The frames between are dropped without clean-up, as by any handler of another compiler.
EXCEPTION_DISPOSITION __cdecl CatchAll(EXCEPTION_RECORD* record, TCatchFrame* frame, CONTEXT*,
                                       void*) {
    if ((record->ExceptionFlags & (EXCEPTION_UNWINDING | EXCEPTION_EXIT_UNWIND)) != 0) {
        return ExceptionContinueSearch;
    }
    DescribeException(*record, *frame->message);
    RtlUnwind(frame, nullptr, record, nullptr);
    // The unwinding may have changed registers that hold `frame`, but left our entry the first.
    __builtin_longjmp(static_cast<TCatchFrame*>(ChainHead())->jump.data(), 1);
}

/// Result of a guarded run: what came out of `body`.
enum TOutcome : std::uint8_t { ocEnded, ocCppException, ocSystemException };

/// A frame of its own, without objects that need clean-up, for the jump to land in.
__attribute__((noinline)) TOutcome RunGuarded(const std::function<void()>& body,
                                              TMessage& message) {
    volatile TOutcome outcome = ocSystemException;
    TCatchFrame frame;
    frame.previous = ChainHead();
    frame.handler = CatchAll;
    frame.message = &message;
    if (__builtin_setjmp(frame.jump.data()) == 0) {
        SetChainHead(&frame);
        outcome = FailsWithMessage(body, message) ? ocCppException : ocEnded;
    }
    SetChainHead(frame.previous);
    return outcome;
}

}  // namespace

void GuardHostCall(const std::function<void()>& body) {
    if (!FailsWithMessage(body, thread_message)) {
        return;
    }
    const std::array<ULONG_PTR, 2> parameters{
        reinterpret_cast<ULONG_PTR>(thread_message.text.data()),
        static_cast<ULONG_PTR>(thread_message.length)};
    RaiseException(kHostExceptionCode, EXCEPTION_NONCONTINUABLE, parameters.size(),
                   parameters.data());
}

bool CallCatchingHostExceptions(const std::function<void()>& body, std::u16string& message) {
    TMessage caught;
    if (RunGuarded(body, caught) == ocEnded) {
        return true;
    }
    message.assign(caught.text.data(), caught.length);
    return false;
}

std::intptr_t SendHostMessage(void* window, std::uint32_t message, std::uintptr_t wparam,
                              std::intptr_t lparam) {
    return window == nullptr ? 0 : SendMessageW(static_cast<HWND>(window), message, wparam, lparam);
}

}  // namespace zm::platform
