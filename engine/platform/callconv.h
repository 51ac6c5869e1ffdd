#pragma once

/// ZM_STDCALL: the calling convention of the host's contract: standard call on 32-bit Windows,
/// the platform's only one elsewhere.
/// ZM_EXPORT: the module's entry. On Windows the module definition file names the export: the
/// compiler's own export would add the decorated name.
#ifdef _WIN32
#define ZM_STDCALL __stdcall
#define ZM_EXPORT extern "C"
#else
#define ZM_STDCALL
#define ZM_EXPORT extern "C" __attribute__((visibility("default")))
#endif
