#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "kernel/KExport.h"

// Every call into the operating system goes through here, one implementation per system
// (kernel/platform/<system>/). The rest of the kernel never includes an OS header.
namespace KPlatform {

// Whether the standard error stream is a terminal (where progress may be drawn).
TORVANE_API bool IsErrorStreamTerminal() noexcept;

// Milliseconds from a monotonic clock (the stamp of processing blocks and automation gestures).
uint64_t MillisecondClock() noexcept;

// A modal warning box without owner or title and with one OK button; where there is no
// desktop to show it on, the text goes to the standard error stream.
void ShowMessageBox(const char16_t* text, size_t length) noexcept;

// Diagnostic output of the trace sink: `line` is UTF-8 without a line end. Must be safe on
// the audio thread: no locks, one write per line.
void WriteTraceLine(const char* line, size_t length) noexcept;

// Where diagnostic trace lines go, from the TORVANE_TRACE environment value ("stderr" or a
// file path); false when tracing is not asked for.
bool OpenTraceDestination() noexcept;

// The folder of the file that holds the kernel's code (the shared library, or the program it is
// linked into), ending in the separator: where files installed beside the kernel are found.
std::string KernelFolder();

// Where the file name begins in `path`: after its last separator ('/', on Windows '\\' too), 0
// when it has none.
size_t FileNameStart(const std::string& path) noexcept;

// Files and folders. Paths are UTF-8; a folder path ends in the system's separator. Failures
// throw KException with a sentence naming the path and the system's reason, e.g.
// "Could not write the file '{0}' ({1})." (see each function).

// The folder under which the user's application data lives: $XDG_DATA_HOME when it holds an
// absolute path, else $HOME/.local/share; on Windows the roaming application-data folder
// (%APPDATA%). Ends in the separator; not created here. "Could not find the user's data
// folder: neither XDG_DATA_HOME nor HOME is set."
std::string UserDataHome();

// `folder` + `name` + separator: the path of a folder inside another.
std::string SubfolderPath(const std::string& folder, const std::string& name);

// Creates the folder and any missing parents; an existing folder is fine.
// "Could not create the folder '{0}' ({1})."
void CreateFolders(const std::string& path);

// The whole content, or nothing when there is no such file. "Could not read the file '{0}' ({1})."
std::optional<std::string> ReadFile(const std::string& path);

// Replaces the file all at once: the content goes to a new file in the same folder, is flushed
// to the disk, and only then renamed over `path`. Readers see the old or the new content,
// never a mixture; after a failure the old file is untouched and no temporary file remains.
// The folder must exist. "Could not write the file '{0}' ({1})."
void WriteFileAtomically(const std::string& path, std::string_view contents);

// Test seam: the next `count` atomic writes fail once their temporary file is written, as on a
// full disk, so that tests can see what a failed write leaves behind.
void InjectAtomicWriteFailures(int count) noexcept;

// Moves a file, replacing one at `to`. "Could not rename the file '{0}' to '{1}' ({2})."
TORVANE_API void RenameFile(const std::string& from, const std::string& to);

// A file to write an output into before it is renamed over `path`: a hidden sibling of `path`
// that no other writer uses, created empty with the permissions of the file at `path` (the
// usual ones for a new file when there is none). Answers the open descriptor, and the name in
// `partial`. "Could not write the file '{0}' ({1})."
TORVANE_API int CreatePartialFile(const std::string& path, std::string& partial);

// While a path is set, an interrupt (SIGINT or SIGTERM) removes that file before the process
// ends as the signal would end it; an empty path stops that.
TORVANE_API void RemoveOnInterrupt(const std::string& path);

// Answers false when there was no such file. "Could not remove the file '{0}' ({1})."
TORVANE_API bool RemoveFile(const std::string& path);

// Names of the regular files in the folder (hidden ones included, sub-folders not), sorted
// by byte value; a missing folder holds none. "Could not list the folder '{0}' ({1})."
std::vector<std::string> ListFiles(const std::string& folder);

// Names of the folders in the folder (hidden ones included), sorted by byte value; a missing
// folder holds none. "Could not list the folder '{0}' ({1})."
std::vector<std::string> ListFolders(const std::string& folder);

// The folder that holds a file or a folder, ending in the separator; a root holds itself.
std::string ParentFolder(const std::string& path);

// A folder's path as the functions here take it: ending in the separator.
std::string AsFolder(const std::string& path);

// The user's home folder ($HOME; on Windows the profile folder), ending in the separator.
// "Could not find the user's home folder."
std::string HomeFolder();

// A new, empty folder of the caller's own under the system's temporary folder.
// "Could not create a temporary folder in '{0}' ({1})."
std::string CreateTemporaryFolder();

// Removes the folder with everything in it; a missing folder is fine.
// "Could not remove the folder '{0}' ({1})."
void RemoveFolderTree(const std::string& path);

}  // namespace KPlatform
