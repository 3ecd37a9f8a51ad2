#include "simulator/run/file_list.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <utility>

#include "simulator/package/package_names.h"
#include "simulator/phone/text.h"
#include "util/scoped_fd.h"

namespace simulator {

namespace {

namespace fs = std::filesystem;

std::optional<std::string> ReadNames(const FileListOptions& options,
                                     std::vector<std::string>* names);
bool ReadAll(const std::string& file, std::string* content);
void Walk(const std::string& root, FileList* list);
void AddEntry(const fs::directory_entry& entry, std::vector<std::string>* directories,
              std::vector<ListedFile>* found, size_t* others);

}  // namespace

std::optional<std::string> ListFiles(const FileListOptions& options, FileList* list) {
  std::vector<std::string> names = options.names;
  if (!options.list.empty()) {
    if (auto problem = ReadNames(options, &names)) return problem;
  }
  for (const std::string& name : names) {
    std::error_code error;
    if (options.is_recursive && fs::is_directory(name, error)) {
      Walk(name, list);
    } else {
      list->files.push_back({name});
    }
  }
  return {};
}

namespace {

std::optional<std::string> ReadNames(const FileListOptions& options,
                                     std::vector<std::string>* names) {
  const std::string title =
      options.list == "-" ? "the list on standard input" : "the list " + options.list;
  std::string content;
  if (!ReadAll(options.list, &content)) {
    return "cannot read " + title + ": " + strerrordesc_np(errno);
  }
  // The system cuts a name at its first NUL byte. The part before this byte could name another
  // file.
  if (!options.has_nul && content.find('\0') != std::string::npos) {
    return title + " contains NUL bytes; use -0 if its names end with NUL bytes";
  }
  const size_t before = names->size();
  for (std::string& name : Split(content, options.has_nul ? '\0' : '\n')) {
    if (!name.empty()) names->push_back(std::move(name));
  }
  if (names->size() == before) return title + " contains no file names";
  return {};
}

// Returns false with errno set if the file cannot be read.
bool ReadAll(const std::string& file, std::string* content) {
  constexpr size_t kPart = 1 << 16;
  const bool is_standard_input = file == "-";
  const ScopedFd opened(is_standard_input ? -1 : open(file.c_str(), O_RDONLY | O_CLOEXEC));
  const int fd = is_standard_input ? STDIN_FILENO : opened.get();
  if (fd < 0) return false;
  std::string part(kPart, '\0');
  ssize_t size;
  while ((size = read(fd, part.data(), part.size())) != 0) {
    if (size < 0 && errno != EINTR) return false;
    if (size > 0) content->append(part, 0, static_cast<size_t>(size));
  }
  return true;
}

void Walk(const std::string& root, FileList* list) {
  std::vector<ListedFile> found;
  std::vector<std::string> directories = {root};
  while (!directories.empty()) {
    const std::string directory = std::move(directories.back());
    directories.pop_back();
    std::error_code error;
    for (fs::directory_iterator entry(directory, error); entry != fs::directory_iterator();
         entry.increment(error)) {
      AddEntry(*entry, &directories, &found, &list->others);
    }
    if (error) found.push_back({directory, ListedFile::State::kUnreadable, error.value()});
  }
  if (found.empty()) found.push_back({root, ListedFile::State::kWithoutPackages, 0});
  std::sort(found.begin(), found.end(),
            [](const ListedFile& a, const ListedFile& b) { return a.name < b.name; });
  std::move(found.begin(), found.end(), std::back_inserter(list->files));
}

// Skips symbolic links to directories. If the file type of an entry cannot be read, for example
// because the entry's path is too long, the entry is listed as unreadable.
void AddEntry(const fs::directory_entry& entry, std::vector<std::string>* directories,
              std::vector<ListedFile>* found, size_t* others) {
  std::error_code error;
  const std::string path = entry.path().string();
  const fs::file_status status = entry.symlink_status(error);
  if (status.type() == fs::file_type::none) {
    found->push_back({path, ListedFile::State::kUnreadable, error.value()});
  } else if (fs::is_directory(status)) {
    directories->push_back(path);
  } else if (entry.is_directory(error)) {
    return;
  } else if (IsPackageName(path)) {
    found->push_back({path});
  } else {
    ++*others;
  }
}

}  // namespace

}  // namespace simulator
