#include "b_platform_dynlib.h"
#include "b_win_text.h"

#include <windows.h>

namespace base::platform {

void* openLibrary(const base::string& fileName, LibraryError& error) {
  // A missing dependency would otherwise stop the process with a dialog box.
  const UINT previous = GetErrorMode();
  SetErrorMode(previous | SEM_FAILCRITICALERRORS);
  HMODULE library = LoadLibraryW(wideText(fileName).c_str());
  if (!library) error.code = GetLastError();
  SetErrorMode(previous);
  return reinterpret_cast<void*>(library);
}

void* findSymbol(void* library, const char* name, bool& missing, LibraryError& error) {
  FARPROC symbol = GetProcAddress(static_cast<HMODULE>(library), name);
  if (symbol) return reinterpret_cast<void*>(symbol);
  error.code = GetLastError();
  missing = error.code == ERROR_PROC_NOT_FOUND;
  return nullptr;
}

void closeLibrary(void* library) { FreeLibrary(static_cast<HMODULE>(library)); }

const char* libraryFileSuffix() { return ".dll"; }

}  // namespace base::platform
