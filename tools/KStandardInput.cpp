#include "tools/KStandardInput.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <string_view>
#include <utility>

size_t KStandardInput::Take(char* into, size_t count) {
  const size_t got = std::fread(into, 1, count, stdin);
  if (static_cast<size_t>(taken_) < kKept) kept_.insert(kept_.end(), into, into + std::min(got, kKept - static_cast<size_t>(taken_)));
  taken_ += static_cast<int64_t>(got);
  return got;
}

sf_count_t KStandardInput::ReadBytes(char* into, sf_count_t count) {
  sf_count_t done = 0;
  char skipped[65536];
  while (done < count) {
    if (position_ < taken_) {  // inside the kept start (Seek allows nothing else behind)
      const size_t n = static_cast<size_t>(std::min<int64_t>(static_cast<int64_t>(kept_.size()) - position_, count - done));
      std::memcpy(into + done, kept_.data() + position_, n);
      position_ += static_cast<int64_t>(n), done += static_cast<sf_count_t>(n);
    } else if (position_ > taken_) {
      // A seek forward within the kept start passes over the bytes in between; beyond it the
      // stream looks ended, so that a header reader looking past the audio for more chunks
      // (WAV, AIFF) comes back to the audio instead of consuming it.
      if (position_ > static_cast<int64_t>(kKept)) break;
      if (Take(skipped, static_cast<size_t>(std::min<int64_t>(position_ - taken_, sizeof(skipped)))) == 0) break;
    } else {
      const size_t got = Take(into + done, static_cast<size_t>(count - done));
      if (got == 0) break;
      position_ += static_cast<int64_t>(got), done += static_cast<sf_count_t>(got);
    }
  }
  return done;
}

sf_count_t KStandardInput::Seek(sf_count_t offset, int whence) {
  const int64_t target = whence == SEEK_SET ? offset : (whence == SEEK_CUR ? position_ + offset : -1);
  if (target < 0 || (target < taken_ && target >= static_cast<int64_t>(kept_.size()))) return -1;
  position_ = target;
  return position_;
}

std::string KStandardInput::ContainerName() const {
  const std::string_view start(kept_.data(), std::min<size_t>(kept_.size(), 12));
  const std::pair<std::string_view, const char*> signatures[] = {
      {"fLaC", "FLAC"}, {"OggS", "Ogg"}, {"RIFF", "WAV"}, {"RF64", "RF64"}, {"FORM", "AIFF"}, {"ID3", "MP3"}, {"caff", "CAF"}, {".snd", "AU"}};
  for (const auto& [signature, name] : signatures)
    if (start.substr(0, signature.size()) == signature) return name;
  if (start.size() >= 2 && static_cast<unsigned char>(start[0]) == 0xFF && (static_cast<unsigned char>(start[1]) & 0xE0) == 0xE0) return "MP3";
  return start.empty() ? "empty" : "unknown";
}
