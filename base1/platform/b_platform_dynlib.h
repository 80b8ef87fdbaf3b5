#pragma once

// Dynamic libraries: one definition per function in b_dynlib_posix.cpp and b_dynlib_win.cpp.

#include "b_containers.h"

#include <cstdint>

namespace base::platform {

/// Why a library call failed: the system's code and, where the system words it apart from
/// the code, its own text.
struct LibraryError {
  std::uint32_t code = 0;
  base::string text;
};

/// The loaded library at `fileName` (UTF-8), with critical-error dialogs off; null, with
/// `error` filled, when it cannot be loaded.
void* openLibrary(const base::string& fileName, LibraryError& error);

/// The address of the exported symbol `name`. Null with `missing` set when the library does
/// not export it; null with `error` filled for any other failure.
void* findSymbol(void* library, const char* name, bool& missing, LibraryError& error);

void closeLibrary(void* library);

/// The end of a library's file name on this system.
const char* libraryFileSuffix();

}  // namespace base::platform
