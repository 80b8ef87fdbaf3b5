#pragma once

// The system pieces of the core library: one definition per function in b_system_posix.cpp
// and b_system_win.cpp. The other platform concerns have their own header in this folder;
// nothing outside it calls the system.

#include "b_containers.h"

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <ctime>
#include <string>

namespace base::platform {

/// Text of the calling thread's stack without its innermost `skip` frames, a frame a line.
base::string captureStack(int skip);

/// The system's text for an error code as the system gives it; empty for an unknown code.
base::string systemErrorText(std::uint32_t code);

/// A block of `size` bytes that std::free releases; null when there is no memory. Large
/// blocks (a mesh's arrays) may be placed where the system can back them with large pages,
/// so that filling them costs a page fault per 2 MiB instead of per 4 KiB.
void* allocateBytes(std::size_t size);

/// The local calendar time of `time`; thread-safe.
std::tm localTime(std::time_t time);

/// The separator that the system's paths use.
char pathSeparator();

/// The running program's full path (UTF-8); throws base::api_exception when the system
/// cannot tell it.
base::string executablePath();

/// Whether `stream` is an interactive terminal.
bool isTerminal(std::FILE* stream);

/// Opens the file at `path` (UTF-8) for appending, as a C stream that the caller closes
/// with std::fclose; null, with the C library's reason in `error`, when it cannot.
std::FILE* openForAppending(const std::string& path, std::string& error);

/// A lock object made in `storage` (of `size` bytes): a critical section on Windows, a
/// mutex elsewhere; entered, left and destroyed through the same storage.
void createLock(void* storage, std::size_t size);
void destroyLock(void* storage);
void enterLock(void* storage);
void leaveLock(void* storage);

/// Lets another thread run.
void yieldThread();

/// Sleeps the calling thread; 0 gives up the rest of its time slice.
void sleepMilliseconds(unsigned milliseconds);

}  // namespace base::platform
