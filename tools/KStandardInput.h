#pragma once

#include <sndfile.h>

#include <cstdint>
#include <string>
#include <vector>

// Standard input as a file libsndfile can open, read as a stream: the first megabyte stays in
// memory, so the header probes of every format (which seek back to the start) work on a pipe,
// while the audio itself passes through without being kept. A seek back past what is kept, or
// to the end, fails, and the format's reader reports the failure; reading far ahead of the
// stream finds its end.
class KStandardInput {
public:
  static constexpr size_t kKept = size_t{1} << 20;

  SF_VIRTUAL_IO& Callbacks() noexcept { return callbacks_; }
  // The container the first bytes announce ("FLAC", "Ogg", "WAV", ...), for messages.
  std::string ContainerName() const;

private:
  sf_count_t ReadBytes(char* into, sf_count_t count);
  sf_count_t Seek(sf_count_t offset, int whence);
  // Takes up to `count` more bytes from standard input, keeping them while they are at the start.
  size_t Take(char* into, size_t count);

  std::vector<char> kept_;  // the first bytes of the stream
  int64_t position_ = 0;    // where the reader is
  int64_t taken_ = 0;       // bytes taken from standard input so far
  SF_VIRTUAL_IO callbacks_{
      [](void*) -> sf_count_t { return SF_COUNT_MAX; },  // a stream's length is unknown
      [](sf_count_t offset, int whence, void* self) { return static_cast<KStandardInput*>(self)->Seek(offset, whence); },
      [](void* into, sf_count_t count, void* self) { return static_cast<KStandardInput*>(self)->ReadBytes(static_cast<char*>(into), count); },
      [](const void*, sf_count_t, void*) -> sf_count_t { return 0; },
      [](void* self) -> sf_count_t { return static_cast<KStandardInput*>(self)->position_; },
  };
};
