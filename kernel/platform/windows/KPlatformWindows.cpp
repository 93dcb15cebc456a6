#include <fcntl.h>
#include <io.h>
#include <shlobj.h>
#include <windows.h>

#include <algorithm>
#include <atomic>
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
#include "kernel/platform/windows/KWideText.h"

namespace {
std::atomic<HANDLE> gTraceHandle{INVALID_HANDLE_VALUE};

// The file a console interrupt removes: a fixed buffer, set before the handler may read it.
wchar_t gInterruptPath[4096];
std::atomic<bool> gInterruptPathSet{false};

// Removes the partial file, then lets the next handler (the default one ends the process) act.
BOOL WINAPI RemoveOnConsoleInterrupt(DWORD) {
  if (gInterruptPathSet.load()) ::DeleteFileW(gInterruptPath);
  return FALSE;
}

KString FromPath(const std::string& path) { return KString::FromUtf8(path); }
KString Reason(DWORD error) { return KString::FromUtf8(KPlatform::SystemMessage(error)); }

[[noreturn]] void FailOnPath(const KString& pattern, const std::string& path, DWORD error) {
  throw KException(KFormatText(pattern, FromPath(path), Reason(error)));
}

[[noreturn]] void FailOnPath(const KString& pattern, const std::string& path, const std::error_code& error) {
  throw KException(KFormatText(pattern, FromPath(path), KString::FromUtf8(error.message())));
}

std::filesystem::path FsPath(const std::string& path) { return std::filesystem::path(KPlatform::Wide(path)); }

// The error of the first failing step, or 0.
DWORD WriteWhole(HANDLE file, std::string_view contents) noexcept {
  while (!contents.empty()) {
    const DWORD chunk = static_cast<DWORD>(std::min<size_t>(contents.size(), 1u << 30));
    DWORD written = 0;
    if (!::WriteFile(file, contents.data(), chunk, &written, nullptr)) return ::GetLastError();
    if (written == 0) return ERROR_WRITE_FAULT;
    contents.remove_prefix(written);
  }
  return 0;
}

// A hidden sibling of `path` that no other writer uses, created exclusively, so that a name left
// by a crashed process is skipped rather than reused. Answers the open handle, or
// INVALID_HANDLE_VALUE with the system's error set.
HANDLE OpenTemporarySibling(const std::string& path, std::string& temporary) {
  for (int attempt = 0; attempt < 100; ++attempt) {
    temporary = KPlatformShared::TemporarySiblingName(path, ::GetCurrentProcessId());
    HANDLE file = ::CreateFileW(KPlatform::Wide(temporary).c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW,
                                FILE_ATTRIBUTE_NORMAL, nullptr);
    if (file != INVALID_HANDLE_VALUE || ::GetLastError() != ERROR_FILE_EXISTS) return file;
  }
  ::SetLastError(ERROR_FILE_EXISTS);
  return INVALID_HANDLE_VALUE;
}

bool Replace(const std::string& from, const std::string& to) {
  return ::MoveFileExW(KPlatform::Wide(from).c_str(), KPlatform::Wide(to).c_str(), MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH);
}

// Whether message boxes can be seen: the process's window station is interactive.
bool HasDesktop() noexcept {
  USEROBJECTFLAGS flags{};
  HWINSTA station = ::GetProcessWindowStation();
  return station && ::GetUserObjectInformationW(station, UOI_FLAGS, &flags, sizeof(flags), nullptr) && (flags.dwFlags & WSF_VISIBLE);
}

// Through the C runtime's descriptor 2, so that a redirection of it (as tests capture it) holds;
// its text mode turns each line end into the system's.
void WriteToErrorStream(const char* data, size_t length) noexcept { ::_write(2, data, static_cast<unsigned>(length)); }
}  // namespace

bool KPlatform::IsErrorStreamTerminal() noexcept {
  DWORD mode = 0;
  return ::GetConsoleMode(::GetStdHandle(STD_ERROR_HANDLE), &mode) != 0;
}

// timeGetTime wraps after 49.7 days; the high half is carried so that differences of stamps
// stay right across a wrap (the clock is read far more often than once per wrap).
uint64_t KPlatform::MillisecondClock() noexcept {
  static std::atomic<uint64_t> latest{0};
  const uint32_t now = ::timeGetTime();
  uint64_t seen = latest.load(std::memory_order_relaxed);
  for (;;) {
    uint64_t stamp = (seen & ~uint64_t{0xffffffff}) | now;
    if (stamp + 0x80000000u < seen) stamp += uint64_t{1} << 32;
    if (stamp <= seen) return stamp;
    if (latest.compare_exchange_weak(seen, stamp, std::memory_order_relaxed)) return stamp;
  }
}

void KPlatform::ShowMessageBox(const char16_t* text, size_t length) noexcept {
  try {
    // A box that was shown answers the button that closed it; one that could not be shown (no
    // display behind the desktop) answers 0, or -1 from a dialog whose window failed (as under
    // Wine without a display): the text then goes to the standard error stream as well.
    if (HasDesktop()) {
      const std::wstring wide(reinterpret_cast<const wchar_t*>(text), length);
      if (::MessageBoxW(nullptr, wide.c_str(), nullptr, MB_OK | MB_ICONEXCLAMATION) > 0) return;
    }
    std::string line;
    KUtf8::Encode(text, static_cast<int32_t>(length), line);
    line.push_back('\n');
    WriteToErrorStream(line.data(), line.size());
  } catch (...) {
    // Out of memory while reporting: nothing better to do than stay silent.
  }
}

void KPlatform::WriteTraceLine(const char* line, size_t length) noexcept {
  HANDLE file = gTraceHandle.load(std::memory_order_acquire);
  if (file == INVALID_HANDLE_VALUE) return;
  // One write of line and line end together keeps lines from different threads whole.
  char buffer[1024];
  const size_t n = length < sizeof(buffer) - 2 ? length : sizeof(buffer) - 2;
  std::memcpy(buffer, line, n);
  buffer[n] = '\r';
  buffer[n + 1] = '\n';
  DWORD written = 0;
  ::WriteFile(file, buffer, static_cast<DWORD>(n + 2), &written, nullptr);
}

bool KPlatform::OpenTraceDestination() noexcept {
  const char* where = std::getenv("TORVANE_TRACE");
  if (!where || !*where) return false;
  HANDLE file = INVALID_HANDLE_VALUE;
  if (std::strcmp(where, "stderr") == 0) {
    file = ::GetStdHandle(STD_ERROR_HANDLE);
  } else {
    try {
      // Appending writes go to the end as one piece, as O_APPEND does.
      file = ::CreateFileW(Wide(where).c_str(), FILE_APPEND_DATA, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_ALWAYS,
                           FILE_ATTRIBUTE_NORMAL, nullptr);
    } catch (...) {
      return false;
    }
  }
  if (file == INVALID_HANDLE_VALUE || file == nullptr) return false;
  gTraceHandle.store(file, std::memory_order_release);
  return true;
}

namespace {
// A shell folder's path as the system gives it, or empty when it has none.
std::string KnownFolder(REFKNOWNFOLDERID id) {
  wchar_t* folder = nullptr;
  const HRESULT result = ::SHGetKnownFolderPath(id, KF_FLAG_DEFAULT, nullptr, &folder);
  std::string path = SUCCEEDED(result) && folder ? KPlatform::Narrow(folder, static_cast<int>(std::wcslen(folder))) : std::string();
  ::CoTaskMemFree(folder);
  return path;
}
}  // namespace

// %APPDATA% when it holds an absolute path (a drive's or a share's), as programs that move a
// user's data set it; else the shell's roaming application data folder, which it normally names.
std::string KPlatform::UserDataHome() {
  const wchar_t* variable = ::_wgetenv(L"APPDATA");
  const std::string set = variable ? Narrow(variable, static_cast<int>(std::wcslen(variable))) : std::string();
  const bool absolute = (set.size() >= 3 && set[1] == ':' && (set[2] == '\\' || set[2] == '/')) || set.rfind("\\\\", 0) == 0;
  std::string home = absolute ? set : KnownFolder(FOLDERID_RoamingAppData);
  if (home.empty()) throw KException("Could not find the user's data folder: the roaming application data folder is unknown.");
  while (home.size() > 3 && (home.back() == '\\' || home.back() == '/')) home.pop_back();
  return home.back() == '\\' ? home : home + "\\";
}

std::string KPlatform::SubfolderPath(const std::string& folder, const std::string& name) { return folder + name + "\\"; }

void KPlatform::CreateFolders(const std::string& path) {
  std::error_code error;
  std::filesystem::create_directories(FsPath(path), error);
  if (error) FailOnPath("Could not create the folder '{0}' ({1}).", path, error);
}

std::optional<std::string> KPlatform::ReadFile(const std::string& path) {
  HANDLE file = ::CreateFileW(Wide(path).c_str(), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                              OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
  if (file == INVALID_HANDLE_VALUE) {
    const DWORD error = ::GetLastError();
    if (error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND) return std::nullopt;
    FailOnPath("Could not read the file '{0}' ({1}).", path, error);
  }
  std::string contents;
  LARGE_INTEGER size{};
  if (::GetFileSizeEx(file, &size) && size.QuadPart > 0) contents.reserve(static_cast<size_t>(size.QuadPart));
  char buffer[65536];
  for (;;) {
    DWORD got = 0;
    if (!::ReadFile(file, buffer, sizeof(buffer), &got, nullptr)) {
      const DWORD error = ::GetLastError();
      ::CloseHandle(file);
      FailOnPath("Could not read the file '{0}' ({1}).", path, error);
    }
    if (got == 0) break;
    contents.append(buffer, got);
  }
  ::CloseHandle(file);
  return contents;
}

void KPlatform::WriteFileAtomically(const std::string& path, std::string_view contents) {
  std::string temporary;
  HANDLE file = OpenTemporarySibling(path, temporary);
  if (file == INVALID_HANDLE_VALUE) FailOnPath("Could not write the file '{0}' ({1}).", path, ::GetLastError());
  DWORD error = WriteWhole(file, contents);
  if (!error && KPlatformShared::ConsumeInjectedFailure()) error = ERROR_DISK_FULL;
  if (!error && !::FlushFileBuffers(file)) error = ::GetLastError();
  if (!::CloseHandle(file) && !error) error = ::GetLastError();
  if (!error && !Replace(temporary, path)) error = ::GetLastError();
  if (error) {
    ::DeleteFileW(Wide(temporary).c_str());
    FailOnPath("Could not write the file '{0}' ({1}).", path, error);
  }
}

void KPlatform::RenameFile(const std::string& from, const std::string& to) {
  if (Replace(from, to)) return;
  const KString reason = Reason(::GetLastError());
  throw KException(KFormatText("Could not rename the file '{0}' to '{1}' ({2}).", FromPath(from), FromPath(to), reason));
}

// Windows files carry no permission bits to take over; the descriptor is one of the C runtime,
// as the audio-file library expects.
int KPlatform::CreatePartialFile(const std::string& path, std::string& partial) {
  HANDLE file = OpenTemporarySibling(path, partial);
  if (file == INVALID_HANDLE_VALUE) FailOnPath("Could not write the file '{0}' ({1}).", path, ::GetLastError());
  const int fd = ::_open_osfhandle(reinterpret_cast<intptr_t>(file), _O_BINARY);
  if (fd < 0) {
    ::CloseHandle(file);
    ::DeleteFileW(Wide(partial).c_str());
    FailOnPath("Could not write the file '{0}' ({1}).", path, ERROR_TOO_MANY_OPEN_FILES);
  }
  return fd;
}

void KPlatform::RemoveOnInterrupt(const std::string& path) {
  static const bool installed = ::SetConsoleCtrlHandler(RemoveOnConsoleInterrupt, TRUE) != 0;
  (void)installed;
  gInterruptPathSet.store(false);
  const std::wstring wide = Wide(path);
  if (wide.empty() || wide.size() >= std::size(gInterruptPath)) return;
  std::memcpy(gInterruptPath, wide.c_str(), (wide.size() + 1) * sizeof(wchar_t));
  gInterruptPathSet.store(true);
}

bool KPlatform::RemoveFile(const std::string& path) {
  if (::DeleteFileW(Wide(path).c_str())) return true;
  const DWORD error = ::GetLastError();
  if (error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND) return false;
  FailOnPath("Could not remove the file '{0}' ({1}).", path, error);
}

namespace {
// The names of the entries in a folder that are folders (or, with `folders` false, files).
std::vector<std::string> ListEntries(const std::string& folder, bool folders) {
  std::vector<std::string> names;
  std::string pattern = folder;
  if (!pattern.empty() && pattern.back() != '\\' && pattern.back() != '/') pattern += '\\';
  WIN32_FIND_DATAW entry{};
  HANDLE search = ::FindFirstFileW(KPlatform::Wide(pattern + "*").c_str(), &entry);
  if (search == INVALID_HANDLE_VALUE) {
    const DWORD error = ::GetLastError();
    if (error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND) return names;
    FailOnPath("Could not list the folder '{0}' ({1}).", folder, error);
  }
  do {
    const bool isFolder = (entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
    const bool dots = std::wcscmp(entry.cFileName, L".") == 0 || std::wcscmp(entry.cFileName, L"..") == 0;
    if (isFolder == folders && !dots) names.push_back(KPlatform::Narrow(entry.cFileName, static_cast<int>(std::wcslen(entry.cFileName))));
  } while (::FindNextFileW(search, &entry));
  const DWORD error = ::GetLastError();
  ::FindClose(search);
  if (error != ERROR_NO_MORE_FILES) FailOnPath("Could not list the folder '{0}' ({1}).", folder, error);
  std::sort(names.begin(), names.end());
  return names;
}
}  // namespace

std::vector<std::string> KPlatform::ListFiles(const std::string& folder) { return ListEntries(folder, false); }

std::vector<std::string> KPlatform::ListFolders(const std::string& folder) { return ListEntries(folder, true); }

std::string KPlatform::ParentFolder(const std::string& path) {
  std::string trimmed = path;
  while (trimmed.size() > 3 && (trimmed.back() == '\\' || trimmed.back() == '/')) trimmed.pop_back();
  const size_t separator = trimmed.find_last_of("\\/");
  return separator == std::string::npos ? trimmed + "\\" : trimmed.substr(0, separator + 1);
}

std::string KPlatform::AsFolder(const std::string& path) {
  return !path.empty() && (path.back() == '\\' || path.back() == '/') ? path : path + "\\";
}

std::string KPlatform::HomeFolder() {
  const std::string home = KnownFolder(FOLDERID_Profile);
  if (home.empty()) throw KException("Could not find the user's home folder.");
  return home.back() == '\\' ? home : home + "\\";
}

std::string KPlatform::CreateTemporaryFolder() {
  wchar_t base[MAX_PATH + 1];
  const DWORD length = ::GetTempPathW(MAX_PATH + 1, base);
  if (length == 0 || length > MAX_PATH) FailOnPath("Could not create a temporary folder in '{0}' ({1}).", "%TEMP%", ::GetLastError());
  const std::string folder = Narrow(base, static_cast<int>(length));
  for (int attempt = 0; attempt < 100; ++attempt) {
    const std::string path = folder + "torvane-" + std::to_string(::GetCurrentProcessId()) + "-" +
                             std::to_string(::GetTickCount64() % 1000000) + "-" + std::to_string(KPlatformShared::NextTemporaryNumber());
    if (::CreateDirectoryW(Wide(path).c_str(), nullptr)) return path + "\\";
    if (::GetLastError() != ERROR_ALREADY_EXISTS) break;
  }
  FailOnPath("Could not create a temporary folder in '{0}' ({1}).", folder, ::GetLastError());
}

void KPlatform::RemoveFolderTree(const std::string& path) {
  std::error_code error;
  std::filesystem::remove_all(FsPath(path), error);
  if (error) FailOnPath("Could not remove the folder '{0}' ({1}).", path, error);
}

std::string KPlatform::KernelFolder() {
  static const char anchor = 0;
  const std::string path = ModulePathOf(&anchor);
  return path.substr(0, KPlatform::FileNameStart(path));
}

size_t KPlatform::FileNameStart(const std::string& path) noexcept {
  const size_t separator = path.find_last_of("/\\");
  return separator == std::string::npos ? 0 : separator + 1;
}
