#include "b_fs_enums.h"

#include "b_exception.h"
#include "b_path.h"

namespace base::fs {

void ChainedEnum::next() {
  if (!m_current) raise<exception>("base::fs::ChainedEnum::next", "invalid call to next() at the end of a listing");
  m_current->next();
  if (m_current->atEnd()) openNext();
}

template <class Next>
void MultiFindFilesEnum<Next>::openNext() {
  m_current = nullptr;
  while (m_nextPlugin < m_plugins.size()) {
    ref<IEnum> listing;
    try {
      listing = Next::find(*m_plugins[m_nextPlugin++], m_pattern);
    } catch (const exception&) {
      continue;
    }
    if (listing && !listing->atEnd()) {
      m_current = std::move(listing);
      return;
    }
  }
}

template class MultiFindFilesEnum<NextFile>;
template class MultiFindFilesEnum<NextFolder>;

RecursiveEnum::RecursiveEnum(IPlugin& fileSystem, std::string_view pattern) : m_fileSystem(&fileSystem) {
  const std::size_t wildcard = pattern.find_first_of("*?");
  const base::string start =
      getDirectory(pattern.substr(0, wildcard == std::string_view::npos ? pattern.size() : wildcard));
  const std::size_t lastPart = pattern.find_last_of("/\\");
  m_namePattern = pattern.substr(lastPart == std::string_view::npos ? 0 : lastPart + 1);
  gatherFolders(start);
  openNext();
}

void RecursiveEnum::gatherFolders(const base::string& start) {
  m_folders.push_back(start);
  for (std::size_t i = 0; i < m_folders.size(); ++i) {
    for (ref<IEnum> folders = m_fileSystem->findFolders(m_folders[i] + "*"); !folders->atEnd(); folders->next()) {
      if (folders->attributes() & entryLink) continue;
      base::append(m_folders, getDirectory(folders->directory() + folders->name() + "/"));
    }
  }
}

void RecursiveEnum::openNext() {
  m_current = nullptr;
  while (!m_folders.empty()) {
    ref<IEnum> files = m_fileSystem->findFiles(m_folders.back() + m_namePattern);
    m_folders.pop_back();
    if (!files->atEnd()) {
      m_current = std::move(files);
      return;
    }
  }
}

}  // namespace base::fs
