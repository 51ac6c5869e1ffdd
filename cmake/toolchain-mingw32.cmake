# Cross build of the 32-bit Windows module with Debian's MinGW (posix threads, so that
# std::thread and std::mutex exist).
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR i686)

set(zm_triple i686-w64-mingw32)
set(CMAKE_C_COMPILER ${zm_triple}-gcc-posix)
set(CMAKE_CXX_COMPILER ${zm_triple}-g++-posix)
set(CMAKE_RC_COMPILER ${zm_triple}-windres)
set(CMAKE_AR ${zm_triple}-gcc-ar-posix)
set(CMAKE_RANLIB ${zm_triple}-gcc-ranlib-posix)
set(CMAKE_OBJDUMP ${zm_triple}-objdump)

# A host built by another compiler may call with a 4-byte aligned stack: realign where needed.
# SSE arithmetic instead of the x87 unit gives the same bits as on Linux. The base is what SSE2
# machines have; faster instructions are chosen at run time.
set(zm_flags "-mstackrealign -msse2 -mfpmath=sse -ffp-contract=off")
set(CMAKE_C_FLAGS_INIT "${zm_flags}")
set(CMAKE_CXX_FLAGS_INIT "${zm_flags}")

# Everything of the compiler's run time goes into the module; it needs system DLLs only.
set(CMAKE_EXE_LINKER_FLAGS_INIT "-static -static-libgcc -static-libstdc++")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-static -static-libgcc -static-libstdc++")
set(CMAKE_MODULE_LINKER_FLAGS_INIT "-static -static-libgcc -static-libstdc++")

# The libraries that scripts/build-win32-deps.sh built, a folder outside the tree. While those
# libraries themselves are being built the script gives the folder by ZM_WIN32_DEPS.
if(NOT DEFINED ZM_WIN32_DEPS)
  execute_process(
    COMMAND ${CMAKE_CURRENT_LIST_DIR}/../scripts/build-win32-deps.sh --print-prefix
    OUTPUT_VARIABLE ZM_WIN32_DEPS OUTPUT_STRIP_TRAILING_WHITESPACE RESULT_VARIABLE zm_result)
  if(NOT zm_result EQUAL 0)
    message(FATAL_ERROR "scripts/build-win32-deps.sh --print-prefix failed")
  endif()
endif()
if(NOT IS_DIRECTORY "${ZM_WIN32_DEPS}")
  message(FATAL_ERROR "The libraries for Windows are not built; run scripts/build-win32-deps.sh")
endif()
set(CMAKE_TRY_COMPILE_PLATFORM_VARIABLES ZM_WIN32_DEPS)

list(PREPEND CMAKE_PREFIX_PATH ${ZM_WIN32_DEPS})
set(CMAKE_FIND_ROOT_PATH ${ZM_WIN32_DEPS} /usr/${zm_triple})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

# Test programs run in the Wine folder.
set(CMAKE_CROSSCOMPILING_EMULATOR ${CMAKE_CURRENT_LIST_DIR}/../scripts/run-wine.sh)
