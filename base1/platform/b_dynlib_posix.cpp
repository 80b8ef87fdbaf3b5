#include "b_platform_dynlib.h"

#include <dlfcn.h>

#include <cerrno>

namespace base::platform {

void* openLibrary(const base::string& fileName, LibraryError& error) {
  errno = 0;
  void* library = dlopen(fileName.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (library) return library;
  // dlopen sets errno for a file it cannot open, not for one that is no library.
  error.code = static_cast<std::uint32_t>(errno ? errno : ENOEXEC);
  const char* text = dlerror();
  error.text = text ? text : "";
  return nullptr;
}

void* findSymbol(void* library, const char* name, bool& missing, LibraryError& error) {
  dlerror();
  void* symbol = dlsym(library, name);
  if (symbol) return symbol;
  // dlsym reports every failure as a missing symbol; a symbol whose value is null (an
  // unusual but legal export) also lands here and is treated the same way.
  const char* text = dlerror();
  missing = true;
  if (text) error.text = text;
  return nullptr;
}

void closeLibrary(void* library) { dlclose(library); }

const char* libraryFileSuffix() { return ".so"; }

}  // namespace base::platform
