#include "b_dynlib.h"

#include "b_exception.h"
#include "b_platform_dynlib.h"

#include <fmt/format.h>

namespace base {

namespace {
base::string failureText(std::string_view what, std::string_view fileName, const platform::LibraryError& error) {
  if (error.text.empty()) return base::string(fmt::format("{} '{}'", what, fileName));
  return base::string(fmt::format("{} '{}': {}", what, fileName, error.text));
}
}  // namespace

DynLib::DynLib(std::string_view fileName) : m_handle(nullptr), m_fileName(fileName) {
  platform::LibraryError error;
  m_handle = platform::openLibrary(m_fileName, error);
  if (!m_handle) {
    raise<api_exception>("base::DynLib::DynLib", failureText("Can't load the library", m_fileName, error), error.code);
  }
}

const char* DynLib::fileSuffix() { return platform::libraryFileSuffix(); }

DynLib::~DynLib() {
  if (m_handle) platform::closeLibrary(m_handle);
}

void* DynLib::loadSymbol(const char* name) const {
  if (!m_handle) return nullptr;
  bool missing = false;
  platform::LibraryError error;
  void* symbol = platform::findSymbol(m_handle, name, missing, error);
  if (symbol || missing) return symbol;
  raise<api_exception>("base::DynLib::loadSymbol",
                       failureText(fmt::format("Can't look up '{}' in", name), m_fileName, error), error.code);
}

}  // namespace base
