#include "tools/KAudioFile.h"

#include <sndfile.h>

#include <cerrno>
#include <cstdio>
#include <cstring>

#include "kernel/KException.h"
#include "kernel/platform/KPlatform.h"
#include "tools/KCliArguments.h"
#include "tools/KStandardInput.h"
#include "tools/KStandardOutput.h"

namespace {

// Frames buffered before one write: large writes keep the system's share of a render small
// whatever the host block size.
constexpr int64_t kChunkFrames = 65536;

// Whether libsndfile's account of the header found a data chunk longer than the file; a
// length of all ones is the "unknown" that streaming tools write, no promise.
bool HeaderPromisesMore(SNDFILE* file) {
  char log[8192] = {};
  sf_command(file, SFC_GET_LOG_INFO, log, sizeof(log));
  for (std::string_view rest = log; !rest.empty();) {
    const size_t end = std::min(rest.find('\n'), rest.size());
    const std::string_view line = rest.substr(0, end);
    if ((line.starts_with("data") || line.starts_with("SSND")) && line.find("(should be") != std::string_view::npos &&
        line.find("4294967295") == std::string_view::npos)
      return true;
    rest.remove_prefix(std::min(end + 1, rest.size()));
  }
  return false;
}

}  // namespace

KAudioFileReader::KAudioFileReader(const std::string& path) : name_(path == "-" ? "standard input" : "'" + path + "'") {
  SF_INFO info{};
  if (path == "-") {
    stream_ = std::make_unique<KStandardInput>();
    file_ = sf_open_virtual(&stream_->Callbacks(), SFM_READ, &info, stream_.get());
    if (!file_) Fail(stream_->ContainerName() + " audio cannot be read as a stream (" + sf_strerror(nullptr) + ")");
  } else {
    file_ = sf_open(path.c_str(), SFM_READ, &info);
    if (!file_) Fail(sf_strerror(nullptr));
    truncated_ = HeaderPromisesMore(file_);
  }
  channels_ = info.channels;
  sampleRate_ = info.samplerate;
  frames_ = stream_ ? -1 : info.frames;
  format_ = KSampleFormatOf(info.format);
  for (int kind = SF_STR_FIRST; kind <= SF_STR_LAST; ++kind)
    if (const char* text = sf_get_string(file_, kind); text && *text) tags_.emplace_back(kind, text);
}

KAudioFileReader::~KAudioFileReader() {
  if (file_) sf_close(file_);
}

void KAudioFileReader::Fail(const std::string& reason) const { KCliFail("Cannot read the audio of " + name_ + ": " + reason + "."); }

int64_t KAudioFileReader::Read(float* interleaved, int64_t frames) {
  const sf_count_t got = sf_readf_float(file_, interleaved, frames);
  if (got < 0 || sf_error(file_) != SF_ERR_NO_ERROR) Fail(sf_strerror(file_));
  read_ += got;
  if (got < frames) {
    if (read_ == 0) Fail("it holds no audio");
    if (truncated_) Fail("the file is truncated; it ends before the audio its header announces");
  }
  return got;
}

KAudioFileWriter::KAudioFileWriter(const std::string& path, const KOutputType& type, int32_t channels, double sampleRate,
                                   const KAudioTags& tags)
    : path_(path), channels_(channels) {
  SF_INFO info{};
  info.channels = channels;
  info.samplerate = static_cast<int>(sampleRate);
  const std::string container = type.container.empty() ? KContainerOfPath(path) : type.container;
  info.format = KFileFormat(container, type.format, type.preferred);
  if (!sf_format_check(&info)) KCliFail("Cannot write '" + path + "': the file type cannot hold this audio.");
  const bool pipe = IsStandardOutput() && std::ftell(stdout) < 0;  // standard output redirected to a file can seek
  if (pipe && (container == "wav" || container == "flac")) {
    stream_ = std::make_unique<KStandardOutput>(container == "wav");
    file_ = sf_open_virtual(&stream_->Callbacks(), SFM_WRITE, &info, stream_.get());
  } else if (IsStandardOutput()) {
    file_ = sf_open_fd(1, SFM_WRITE, &info, SF_FALSE);  // the types libsndfile streams itself
  } else {
    const int fd = KPlatform::CreatePartialFile(path, partial_);
    KPlatform::RemoveOnInterrupt(partial_);
    file_ = sf_open_fd(fd, SFM_WRITE, &info, SF_TRUE);
  }
  if (!file_) KCliFail("Cannot write " + Shown() + " as " + container + ": " + sf_strerror(nullptr));
  for (const auto& [kind, text] : tags) sf_set_string(file_, kind, text.c_str());  // where the type holds tags
  if (const int bits = KIntegerBits(KSampleFormatOf(info.format)); bits > 0) {
    quantizer_ = std::make_unique<KQuantizer>(bits, type.dither);
    integers_.resize(static_cast<size_t>(kChunkFrames * channels));
  }
  pending_.reserve(static_cast<size_t>(kChunkFrames * channels));
}

std::string KAudioFileWriter::Shown() const { return IsStandardOutput() ? "standard output" : "the output file '" + path_ + "'"; }

KAudioFileWriter::~KAudioFileWriter() {
  if (file_) Close();
  if (!partial_.empty() && !committed_) {
    KPlatform::RemoveOnInterrupt({});
    try {
      KPlatform::RemoveFile(partial_);
    } catch (const KException&) {
      // The run is failing already; a leftover hidden partial file is the lesser evil.
    }
  }
}

void KAudioFileWriter::Close() noexcept {
  sf_close(file_);
  file_ = nullptr;
}

void KAudioFileWriter::Write(const float* interleaved, int64_t frames) {
  while (frames > 0) {
    const int64_t room = kChunkFrames - static_cast<int64_t>(pending_.size()) / channels_;
    const int64_t n = std::min(room, frames);
    pending_.insert(pending_.end(), interleaved, interleaved + n * channels_);
    interleaved += n * channels_, frames -= n;
    if (n == room) Flush();
  }
}

void KAudioFileWriter::Flush() {
  const int64_t frames = static_cast<int64_t>(pending_.size()) / channels_;
  sf_count_t written;
  if (quantizer_) {
    quantizer_->Convert(pending_.data(), integers_.data(), frames * channels_);
    written = sf_writef_int(file_, integers_.data(), frames);
  } else {
    written = sf_writef_float(file_, pending_.data(), frames);
  }
  if (written != frames) KCliFail("Cannot write " + Shown() + ": " + sf_strerror(file_));
  if (stream_) stream_->Start();  // the header is complete once the first audio is written
  pending_.clear();
}

void KAudioFileWriter::Finish() {
  if (!file_) return;
  Flush();
  const int closed = sf_close(file_);
  file_ = nullptr;
  if (closed != SF_ERR_NO_ERROR) KCliFail("Cannot write " + Shown() + ": " + sf_error_number(closed));
  if (IsStandardOutput() && !(stream_ ? stream_->Finish() : std::fflush(stdout) == 0))
    KCliFail("Cannot write " + Shown() + ": " + std::strerror(errno));
}

void KAudioFileWriter::Commit() {
  Finish();
  if (partial_.empty()) return;
  KPlatform::RenameFile(partial_, path_);  // when this throws, the destructor removes the partial file
  committed_ = true;
  KPlatform::RemoveOnInterrupt({});
}
