#include <fcntl.h>
#include <time.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <cstring>
#include <string>

#include "kernel/KUtf8.h"
#include "kernel/platform/KPlatform.h"

namespace {
std::atomic<int> gTraceDescriptor{-1};

void WriteAll(int fd, const char* data, size_t length) noexcept {
  while (length > 0) {
    const ssize_t written = ::write(fd, data, length);
    if (written <= 0) return;
    data += written;
    length -= static_cast<size_t>(written);
  }
}
}  // namespace

uint64_t KPlatform::MillisecondClock() noexcept {
  timespec now{};
  clock_gettime(CLOCK_MONOTONIC, &now);
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
