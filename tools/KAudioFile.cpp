#include "tools/KAudioFile.h"

#include <sndfile.h>

#include <algorithm>
#include <cctype>

#include "kernel/platform/KPlatform.h"
#include "tools/KCliArguments.h"

namespace {

std::string Extension(const std::string& path) {
  const size_t dot = path.find_last_of('.');
  const size_t slash = path.find_last_of('/');
  if (dot == std::string::npos || (slash != std::string::npos && dot < slash)) return {};
  std::string extension = path.substr(dot + 1);
  std::transform(extension.begin(), extension.end(), extension.begin(), [](unsigned char c) { return std::tolower(c); });
  return extension;
}

// The libsndfile format for a path and a sample format; 32-bit float for WAV and AIFF, 24-bit
// integers for FLAC unless asked otherwise.
int FileFormat(const std::string& path, KSampleFormat format) {
  const std::string extension = Extension(path);
  int container;
  if (extension == "wav") container = SF_FORMAT_WAV;
  else if (extension == "flac") container = SF_FORMAT_FLAC;
  else if (extension == "aiff" || extension == "aif") container = SF_FORMAT_AIFF;
  else if (extension == "ogg") return SF_FORMAT_OGG | SF_FORMAT_VORBIS;
  else KCliFail("Cannot tell the audio type of '" + path + "' from its name: use .wav, .flac, .aiff or .ogg.");
  if (format == KSampleFormat::kDefault) format = container == SF_FORMAT_FLAC ? KSampleFormat::kInt24 : KSampleFormat::kFloat32;
  if (format == KSampleFormat::kFloat32 && container == SF_FORMAT_FLAC) KCliFail("FLAC files cannot hold 32-bit float samples: use --format s24 or s16.");
  const int sample = format == KSampleFormat::kFloat32 ? SF_FORMAT_FLOAT : (format == KSampleFormat::kInt24 ? SF_FORMAT_PCM_24 : SF_FORMAT_PCM_16);
  return container | sample;
}

}  // namespace

KAudioFileReader::KAudioFileReader(const std::string& path) : path_(path) {
  SF_INFO info{};
  file_ = sf_open(path.c_str(), SFM_READ, &info);
  if (!file_) KCliFail("Cannot read the audio file '" + path + "': " + sf_strerror(nullptr));
  channels_ = info.channels;
  sampleRate_ = info.samplerate;
  frames_ = info.frames;
}

KAudioFileReader::~KAudioFileReader() {
  if (file_) sf_close(file_);
}

int64_t KAudioFileReader::Read(float* interleaved, int64_t frames) {
  const sf_count_t read = sf_readf_float(file_, interleaved, frames);
  if (read < 0) KCliFail("Cannot read the audio file '" + path_ + "': " + sf_strerror(file_));
  return read;
}

KSampleFormat KAudioFileWriter::ParseFormat(const std::string& name) {
  if (name == "f32") return KSampleFormat::kFloat32;
  if (name == "s24") return KSampleFormat::kInt24;
  if (name == "s16") return KSampleFormat::kInt16;
  KCliFail("Unknown sample format '" + name + "': use f32, s24 or s16.");
}

KAudioFileWriter::KAudioFileWriter(const std::string& path, KSampleFormat format, int32_t channels, double sampleRate)
    : path_(path) {
  SF_INFO info{};
  info.channels = channels;
  info.samplerate = static_cast<int>(sampleRate);
  info.format = FileFormat(path, format);
  if (!sf_format_check(&info)) KCliFail("Cannot write '" + path + "': the file type cannot hold this audio.");
  const size_t slash = path.find_last_of('/');
  temporary_ = path.substr(0, slash == std::string::npos ? 0 : slash + 1) + "." +
               path.substr(slash == std::string::npos ? 0 : slash + 1) + ".partial";
  file_ = sf_open(temporary_.c_str(), SFM_WRITE, &info);
  if (!file_) KCliFail("Cannot write the output file '" + path + "': " + sf_strerror(nullptr));
  // Integer files clip samples beyond full scale instead of wrapping them around; float files
  // keep every sample as computed.
  sf_command(file_, SFC_SET_CLIPPING, nullptr, SF_TRUE);
}

KAudioFileWriter::~KAudioFileWriter() {
  if (file_) Close();
  if (!committed_) RemoveTemporary();
}

void KAudioFileWriter::RemoveTemporary() noexcept {
  try {
    KPlatform::RemoveFile(temporary_);
  } catch (...) {
    // The run is failing already; a leftover hidden partial file is the lesser evil.
  }
}

void KAudioFileWriter::Close() noexcept {
  sf_close(file_);
  file_ = nullptr;
}

void KAudioFileWriter::Write(const float* interleaved, int64_t frames) {
  if (sf_writef_float(file_, interleaved, frames) != frames)
    KCliFail("Cannot write the output file '" + path_ + "': " + sf_strerror(file_));
}

void KAudioFileWriter::Commit() {
  Close();
  KPlatform::RenameFile(temporary_, path_);  // when this throws, the destructor removes the temporary file
  committed_ = true;
}
