#include "tools/KStandardOutput.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

namespace {

void MarkUnknown(std::vector<char>& bytes, size_t at) {
  if (at + 4 <= bytes.size()) std::memset(bytes.data() + at, 0xFF, 4);
}

}  // namespace

sf_count_t KStandardOutput::WriteBytes(const char* from, sf_count_t count) {
  if (!started_) {
    if (header_.size() < static_cast<size_t>(position_ + count)) header_.resize(static_cast<size_t>(position_ + count));
    std::memcpy(header_.data() + position_, from, static_cast<size_t>(count));
  } else if (position_ >= sent_) {  // earlier bytes are gone: the closing header rewrite
    if (position_ > sent_ || std::fwrite(from, 1, static_cast<size_t>(count), stdout) != static_cast<size_t>(count)) {
      failed_ = true;
      return 0;
    }
    sent_ += count;
  }
  position_ += count;
  end_ = std::max(end_, position_);
  return count;
}

void KStandardOutput::Start() {
  if (started_) return;
  // RIFF length at 4; then chunks of a 4-byte name and a 4-byte length from 12, up to "data".
  if (riff_) MarkUnknown(header_, 4);
  for (size_t at = 12; riff_ && at + 8 <= header_.size();) {
    if (std::memcmp(header_.data() + at, "data", 4) == 0) {
      MarkUnknown(header_, at + 4);
      break;
    }
    uint32_t length;
    std::memcpy(&length, header_.data() + at + 4, 4);  // little-endian, as the machines we run on
    at += 8 + length + (length & 1);
  }
  started_ = true;
  if (std::fwrite(header_.data(), 1, header_.size(), stdout) != header_.size()) failed_ = true;
  sent_ = static_cast<int64_t>(header_.size());
}

bool KStandardOutput::Finish() { return std::fflush(stdout) == 0 && !failed_ && !std::ferror(stdout); }
