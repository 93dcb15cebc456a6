#pragma once

#include <sndfile.h>

#include <cstdint>
#include <vector>

// Standard output as a file libsndfile can write to a pipe. For WAV and FLAC libsndfile writes
// a header at the start and, at the end, seeks back to put the lengths in; a pipe cannot seek.
// So the header is held until Start and the final rewrite is dropped. A FLAC header's zero
// lengths already mean "unknown"; a WAV header's are marked unknown (all ones, as streaming
// tools write and read them).
class KStandardOutput {
public:
  explicit KStandardOutput(bool riff) noexcept : riff_(riff) {}

  SF_VIRTUAL_IO& Callbacks() noexcept { return callbacks_; }
  // Sends what was written so far, its header's lengths marked unknown; everything written
  // after it goes out as it comes. Once only.
  void Start();
  // False when standard output failed to take the audio (a full disk, a closed pipe).
  bool Finish();

private:
  sf_count_t WriteBytes(const char* from, sf_count_t count);

  std::vector<char> header_;
  int64_t position_ = 0, end_ = 0, sent_ = 0;
  bool riff_;  // a WAV header, whose lengths are marked
  bool started_ = false, failed_ = false;
  SF_VIRTUAL_IO callbacks_{
      [](void* self) -> sf_count_t { return static_cast<KStandardOutput*>(self)->end_; },
      [](sf_count_t offset, int whence, void* self) -> sf_count_t {
        auto& out = *static_cast<KStandardOutput*>(self);
        out.position_ = offset + (whence == SEEK_SET ? 0 : (whence == SEEK_CUR ? out.position_ : out.end_));
        return out.position_;
      },
      [](void*, sf_count_t, void*) -> sf_count_t { return 0; },
      [](const void* from, sf_count_t count, void* self) { return static_cast<KStandardOutput*>(self)->WriteBytes(static_cast<const char*>(from), count); },
      [](void* self) -> sf_count_t { return static_cast<KStandardOutput*>(self)->position_; },
  };
};
