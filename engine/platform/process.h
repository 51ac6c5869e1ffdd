#pragma once

/// The process that we are a guest in.
namespace zm::platform {

/// Whether the process is being ended, as opposed to our module being unloaded from a process
/// that lives on. While a process ends, its other threads are gone and other modules may have
/// cleaned up, so that nothing outside our own module may be called. False on systems where
/// clean-up runs with the whole process intact.
bool ProcessIsEnding();

}  // namespace zm::platform
