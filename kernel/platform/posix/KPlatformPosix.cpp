#include <dlfcn.h>
#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <system_error>

#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KUtf8.h"
#include "kernel/platform/KPlatform.h"
#include "kernel/platform/KPlatformShared.h"

namespace {
std::atomic<int> gTraceDescriptor{-1};

// The file an interrupt removes: a fixed buffer, since the handler may only read memory.
char gInterruptPath[4096];
std::atomic<bool> gInterruptPathSet{false};

void RemoveAndEnd(int signal) {
  if (gInterruptPathSet.load()) ::unlink(gInterruptPath);
  ::signal(signal, SIG_DFL);
  ::raise(signal);
}

KString FromPath(const std::string& path) { return KString::FromUtf8(path); }
KString Reason(int error) { return KString::FromUtf8(std::generic_category().message(error)); }

[[noreturn]] void FailOnPath(const KString& pattern, const std::string& path, int error) {
  throw KException(KFormatText(pattern, FromPath(path), Reason(error)));
}

// The error of the first failing step, or 0; retries writes cut short by signals.
int WriteWhole(int fd, std::string_view contents) noexcept {
  while (!contents.empty()) {
    const ssize_t written = ::write(fd, contents.data(), contents.size());
    if (written < 0 && errno == EINTR) continue;
    if (written <= 0) return written < 0 ? errno : EIO;
    contents.remove_prefix(static_cast<size_t>(written));
  }
  return 0;
}

// Diagnostics have nowhere to report their own failure.
void WriteAll(int fd, const char* data, size_t length) noexcept { WriteWhole(fd, std::string_view(data, length)); }

// A hidden sibling of `path` that no other writer uses, created exclusively, so that a name left
// by a crashed process is skipped rather than reused.
int OpenTemporarySibling(const std::string& path, std::string& temporary) {
  for (int attempt = 0; attempt < 100; ++attempt) {
    temporary = KPlatformShared::TemporarySiblingName(path, ::getpid());
    const int fd = ::open(temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
    if (fd >= 0 || errno != EEXIST) return fd;
  }
  errno = EEXIST;
  return -1;
}

// Makes a finished rename in the folder of `path` durable. Best effort: the new content is
// already in place, and a folder that cannot be synced is no reason to report a failed write.
void SyncFolderOf(const std::string& path) {
  const size_t start = KPlatform::FileNameStart(path);
  const std::string folder = start == 0 ? std::string(".") : path.substr(0, start);
  const int fd = ::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (fd < 0) return;
  ::fsync(fd);
  ::close(fd);
}
}  // namespace

bool KPlatform::IsErrorStreamTerminal() noexcept { return ::isatty(STDERR_FILENO) == 1; }

uint64_t KPlatform::MillisecondClock() noexcept {
  timespec now{};
  // The coarse clock (a few milliseconds fine) reads without a system call's worth of work; the
  // audio thread reads it at every block.
  clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
  return static_cast<uint64_t>(now.tv_sec) * 1000u + static_cast<uint64_t>(now.tv_nsec) / 1000000u;
}

void KPlatform::ShowMessageBox(const char16_t* text, size_t length) noexcept {
  try {
    std::string line;
    KUtf8::Encode(text, static_cast<int32_t>(length), line);
    line.push_back('\n');
    WriteAll(STDERR_FILENO, line.data(), line.size());
  } catch (...) {
    // Out of memory while reporting: nothing better to do than stay silent.
  }
}

void KPlatform::WriteTraceLine(const char* line, size_t length) noexcept {
  const int fd = gTraceDescriptor.load(std::memory_order_acquire);
  if (fd < 0) return;
  // One write of line and newline together keeps lines from different threads whole.
  char buffer[1024];
  const size_t n = length < sizeof(buffer) - 1 ? length : sizeof(buffer) - 1;
  std::memcpy(buffer, line, n);
  buffer[n] = '\n';
  WriteAll(fd, buffer, n + 1);
}

bool KPlatform::OpenTraceDestination() noexcept {
  const char* where = std::getenv("TORVANE_TRACE");
  if (!where || !*where) return false;
  int fd = std::strcmp(where, "stderr") == 0 ? STDERR_FILENO : ::open(where, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
  if (fd < 0) return false;
  gTraceDescriptor.store(fd, std::memory_order_release);
  return true;
}

std::string KPlatform::UserDataHome() {
  // Relative values are invalid by the XDG rules and ignored, so that the data never depends
  // on the host's working folder.
  const char* xdg = std::getenv("XDG_DATA_HOME");
  std::string home;
  if (xdg && xdg[0] == '/') {
    home = xdg;
  } else {
    const char* user = std::getenv("HOME");
    if (!user || !*user) throw KException("Could not find the user's data folder: neither XDG_DATA_HOME nor HOME is set.");
    home = std::string(user) + "/.local/share";
  }
  while (home.size() > 1 && home.back() == '/') home.pop_back();
  return home == "/" ? home : home + "/";
}

std::string KPlatform::SubfolderPath(const std::string& folder, const std::string& name) { return folder + name + "/"; }

void KPlatform::CreateFolders(const std::string& path) {
  std::error_code error;
  std::filesystem::create_directories(path, error);
  if (error) FailOnPath("Could not create the folder '{0}' ({1}).", path, error.value());
}

std::optional<std::string> KPlatform::ReadFile(const std::string& path) {
  const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0 && errno == ENOENT) return std::nullopt;
  if (fd < 0) FailOnPath("Could not read the file '{0}' ({1}).", path, errno);
  std::string contents;
  struct stat status {};
  if (::fstat(fd, &status) == 0 && status.st_size > 0) contents.reserve(static_cast<size_t>(status.st_size));
  char buffer[65536];
  for (;;) {
    const ssize_t got = ::read(fd, buffer, sizeof(buffer));
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) {
      const int error = errno;
      ::close(fd);
      FailOnPath("Could not read the file '{0}' ({1}).", path, error);
    }
    if (got == 0) break;
    contents.append(buffer, static_cast<size_t>(got));
  }
  ::close(fd);
  return contents;
}

void KPlatform::WriteFileAtomically(const std::string& path, std::string_view contents) {
  std::string temporary;
  const int fd = OpenTemporarySibling(path, temporary);
  if (fd < 0) FailOnPath("Could not write the file '{0}' ({1}).", path, errno);
  int error = WriteWhole(fd, contents);
  if (!error && KPlatformShared::ConsumeInjectedFailure()) error = ENOSPC;
  if (!error && ::fsync(fd) != 0) error = errno;
  if (::close(fd) != 0 && !error) error = errno;
  if (!error && ::rename(temporary.c_str(), path.c_str()) != 0) error = errno;
  if (error) {
    ::unlink(temporary.c_str());
    FailOnPath("Could not write the file '{0}' ({1}).", path, error);
  }
  SyncFolderOf(path);
}

void KPlatform::RenameFile(const std::string& from, const std::string& to) {
  if (::rename(from.c_str(), to.c_str()) == 0) return;
  const KString reason = Reason(errno);  // before anything else can change errno
  throw KException(KFormatText("Could not rename the file '{0}' to '{1}' ({2}).", FromPath(from), FromPath(to), reason));
}

int KPlatform::CreatePartialFile(const std::string& path, std::string& partial) {
  const int fd = OpenTemporarySibling(path, partial);
  if (fd < 0) FailOnPath("Could not write the file '{0}' ({1}).", path, errno);
  struct stat replaced {};
  if (::stat(path.c_str(), &replaced) == 0 && S_ISREG(replaced.st_mode) && ::fchmod(fd, replaced.st_mode & 07777) != 0) {
    const int error = errno;
    ::close(fd);
    ::unlink(partial.c_str());
    FailOnPath("Could not write the file '{0}' ({1}).", path, error);
  }
  return fd;
}

void KPlatform::RemoveOnInterrupt(const std::string& path) {
  static const bool installed = [] {
    struct sigaction action {};
    action.sa_handler = RemoveAndEnd;
    sigemptyset(&action.sa_mask);
    return ::sigaction(SIGINT, &action, nullptr) == 0 && ::sigaction(SIGTERM, &action, nullptr) == 0;
  }();
  (void)installed;
  gInterruptPathSet.store(false);
  if (path.empty() || path.size() >= sizeof(gInterruptPath)) return;
  std::memcpy(gInterruptPath, path.c_str(), path.size() + 1);
  gInterruptPathSet.store(true);
}

bool KPlatform::RemoveFile(const std::string& path) {
  if (::unlink(path.c_str()) == 0) return true;
  if (errno == ENOENT) return false;
  FailOnPath("Could not remove the file '{0}' ({1}).", path, errno);
}

namespace {
// The names of the entries in a folder that are folders (or, with `folders` false, regular files).
std::vector<std::string> ListEntries(const std::string& folder, bool folders) {
  std::vector<std::string> names;
  std::error_code error;
  std::filesystem::directory_iterator entry(folder, error);
  if (error == std::errc::no_such_file_or_directory) return names;
  for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error)) {
    std::error_code ignored;  // an entry removed while listing is simply neither any more
    if (folders ? entry->is_directory(ignored) : entry->is_regular_file(ignored)) names.push_back(entry->path().filename().string());
  }
  if (error) FailOnPath("Could not list the folder '{0}' ({1}).", folder, error.value());
  std::sort(names.begin(), names.end());
  return names;
}
}  // namespace

std::vector<std::string> KPlatform::ListFiles(const std::string& folder) { return ListEntries(folder, false); }

std::vector<std::string> KPlatform::ListFolders(const std::string& folder) { return ListEntries(folder, true); }

std::string KPlatform::ParentFolder(const std::string& path) {
  std::string trimmed = path;
  while (trimmed.size() > 1 && trimmed.back() == '/') trimmed.pop_back();
  const size_t slash = trimmed.rfind('/');
  return slash == std::string::npos ? std::string("/") : trimmed.substr(0, slash + 1);
}

std::string KPlatform::AsFolder(const std::string& path) { return !path.empty() && path.back() == '/' ? path : path + "/"; }

std::string KPlatform::HomeFolder() {
  const char* home = std::getenv("HOME");
  if (!home || home[0] != '/') throw KException("Could not find the user's home folder.");
  std::string folder = home;
  return folder.back() == '/' ? folder : folder + "/";
}

std::string KPlatform::CreateTemporaryFolder() {
  const char* base = std::getenv("TMPDIR");
  std::string folder = base && *base ? base : "/tmp";
  if (folder.back() != '/') folder += '/';
  std::string pattern = folder + "torvane-XXXXXX";
  if (!::mkdtemp(pattern.data())) FailOnPath("Could not create a temporary folder in '{0}' ({1}).", folder, errno);
  return pattern + "/";
}

void KPlatform::RemoveFolderTree(const std::string& path) {
  std::error_code error;
  std::filesystem::remove_all(path, error);
  if (error) FailOnPath("Could not remove the folder '{0}' ({1}).", path, error.value());
}

std::string KPlatform::KernelFolder() {
  static const char anchor = 0;
  Dl_info info{};
  if (::dladdr(&anchor, &info) == 0 || !info.dli_fname) return {};
  char* resolved = ::realpath(info.dli_fname, nullptr);
  std::string path = resolved ? resolved : info.dli_fname;
  std::free(resolved);
  return path.substr(0, KPlatform::FileNameStart(path));
}

size_t KPlatform::FileNameStart(const std::string& path) noexcept {
  const size_t slash = path.rfind('/');
  return slash == std::string::npos ? 0 : slash + 1;
}
