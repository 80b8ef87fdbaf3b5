#pragma once

#include "b_api.h"
#include "b_containers.h"
#include "b_refcnt.h"

#include <string_view>

namespace base {

/// A dynamic library loaded for the life of the object, held through base::ref<DynLib>.
class BASE1_API DynLib : public RefCntAtomic {
 public:
  /// Loads the library at `fileName` (UTF-8). Throws base::api_exception with the system's
  /// error code and the file name when it cannot be loaded. The system's critical-error
  /// dialogs are off while it loads.
  explicit DynLib(std::string_view fileName);
  ~DynLib() override;
  DynLib(const DynLib&) = delete;
  DynLib& operator=(const DynLib&) = delete;

  /// The address of the exported symbol `name`; null when the library does not export it.
  /// Other lookup failures throw base::api_exception.
  void* loadSymbol(const char* name) const;

  const base::string& fileName() const { return m_fileName; }
  /// The end of a library's file name on this system: ".so", ".dll".
  static const char* fileSuffix();

 private:
  void* m_handle;
  base::string m_fileName;
};

}  // namespace base
