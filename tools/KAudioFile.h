#pragma once

#include <string>

#include "tools/KAudioSource.h"

struct sf_private_tag;  // libsndfile's file handle

// Sample formats an output file may hold.
enum class KSampleFormat { kDefault, kFloat32, kInt24, kInt16 };

// Any file libsndfile reads (WAV, FLAC, AIFF, Ogg, ...).
class KAudioFileReader final : public KAudioSource {
public:
  // "Cannot read the audio file '<path>': <reason>" when the file is missing or not audio.
  explicit KAudioFileReader(const std::string& path);
  ~KAudioFileReader() override;
  KAudioFileReader(const KAudioFileReader&) = delete;
  KAudioFileReader& operator=(const KAudioFileReader&) = delete;

  int32_t Channels() const noexcept override { return channels_; }
  double SampleRate() const noexcept override { return sampleRate_; }
  int64_t Frames() const noexcept override { return frames_; }
  int64_t Read(float* interleaved, int64_t frames) override;

private:
  std::string path_;
  sf_private_tag* file_ = nullptr;
  int32_t channels_ = 0;
  double sampleRate_ = 0.0;
  int64_t frames_ = 0;
};

// Writes an audio file whose container follows the extension of `path` (.wav, .flac, .aiff,
// .ogg) into a temporary file beside it, and puts it in place only on Commit: a failed run
// never leaves a partial or empty output behind.
class KAudioFileWriter {
public:
  KAudioFileWriter(const std::string& path, KSampleFormat format, int32_t channels, double sampleRate);
  ~KAudioFileWriter();
  KAudioFileWriter(const KAudioFileWriter&) = delete;
  KAudioFileWriter& operator=(const KAudioFileWriter&) = delete;

  void Write(const float* interleaved, int64_t frames);
  void Commit();

  // The format name of the command line ("f32", "s24", "s16"), or an error.
  static KSampleFormat ParseFormat(const std::string& name);

private:
  void Close() noexcept;
  void RemoveTemporary() noexcept;

  std::string path_;
  std::string temporary_;
  sf_private_tag* file_ = nullptr;
  bool committed_ = false;  // the temporary file has become the output
};
