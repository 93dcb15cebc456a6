#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "tools/KAudioSource.h"
#include "tools/KAudioType.h"
#include "tools/KQuantizer.h"

struct sf_private_tag;  // libsndfile's file handle
class KStandardInput;
class KStandardOutput;

// Text tags of a file (title, artist, ...), as libsndfile's string kinds and values.
using KAudioTags = std::vector<std::pair<int, std::string>>;

// Any file libsndfile reads (WAV, FLAC, AIFF, Ogg, MP3, ...), or "-": standard input, read as
// a stream whatever its format.
class KAudioFileReader final : public KAudioSource {
public:
  // "Cannot read the audio file '<path>': <reason>" when the file is missing or not audio;
  // "'<path>' holds no audio." for an empty one.
  explicit KAudioFileReader(const std::string& path);
  ~KAudioFileReader() override;
  KAudioFileReader(const KAudioFileReader&) = delete;
  KAudioFileReader& operator=(const KAudioFileReader&) = delete;

  int32_t Channels() const noexcept override { return channels_; }
  double SampleRate() const noexcept override { return sampleRate_; }
  int64_t Frames() const noexcept override { return frames_; }
  // Fewer frames than asked only at the end; a file whose audio ends before its header says
  // (a truncated file) is an error there.
  int64_t Read(float* interleaved, int64_t frames) override;

  // The sample format the input holds (kDefault for compressed encodings).
  KSampleFormat Format() const noexcept { return format_; }
  const KAudioTags& Tags() const noexcept { return tags_; }
  const std::string& Name() const noexcept { return name_; }

private:
  [[noreturn]] void Fail(const std::string& reason) const;

  std::string name_;  // for messages: 'path' or standard input
  std::unique_ptr<KStandardInput> stream_;
  sf_private_tag* file_ = nullptr;
  int32_t channels_ = 0;
  double sampleRate_ = 0.0;
  int64_t frames_ = 0;  // -1: unknown (a stream)
  int64_t read_ = 0;
  bool truncated_ = false;  // the header promised more than the file holds
  KSampleFormat format_ = KSampleFormat::kDefault;
  KAudioTags tags_;
};

// What an output is written as.
struct KOutputType {
  std::string container;  // empty: from the output path's extension
  KSampleFormat format = KSampleFormat::kDefault;
  KSampleFormat preferred = KSampleFormat::kDefault;  // the input's, used when `format` is kDefault
  bool dither = true;
};

// Writes an audio file, or standard output for "-". A file is written into a partial file
// beside it that no other process uses, and renamed into place only on Commit, keeping the
// permissions of a file it replaces; an interrupt or a failure removes the partial file, so a
// failed run never leaves anything behind. Audio is buffered into large writes.
class KAudioFileWriter {
public:
  KAudioFileWriter(const std::string& path, const KOutputType& type, int32_t channels, double sampleRate, const KAudioTags& tags);
  ~KAudioFileWriter();
  KAudioFileWriter(const KAudioFileWriter&) = delete;
  KAudioFileWriter& operator=(const KAudioFileWriter&) = delete;

  void Write(const float* interleaved, int64_t frames);
  // Writes what is buffered and closes the output; the clipped samples are all counted then.
  void Finish();
  // Finishes, then puts the file in place.
  void Commit();

  // Samples held at full scale by an integer output so far.
  int64_t ClippedSamples() const noexcept { return quantizer_ ? quantizer_->ClippedSamples() : 0; }
  bool IsStandardOutput() const noexcept { return path_ == "-"; }
  const std::string& Path() const noexcept { return path_; }

private:
  void Flush();
  void Close() noexcept;
  std::string Shown() const;  // the output as messages name it

  std::string path_;
  std::string partial_;  // empty for standard output
  std::unique_ptr<KStandardOutput> stream_;  // standard output written as WAV
  sf_private_tag* file_ = nullptr;
  int32_t channels_;
  std::vector<float> pending_;  // interleaved frames not yet written
  std::vector<int32_t> integers_;
  std::unique_ptr<KQuantizer> quantizer_;  // integer outputs only
  bool committed_ = false;
};
