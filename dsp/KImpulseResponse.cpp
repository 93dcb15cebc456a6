#include "dsp/KImpulseResponse.h"

#include <samplerate.h>
#include <sndfile.h>

#include <algorithm>
#include <cmath>
#include <memory>

#include "kernel/KException.h"
#include "kernel/KFormat.h"

namespace {
[[noreturn]] void Refuse(const char* pattern, const KString& path) { throw KException(KFormatText(KString::FromUtf8(pattern), path)); }
}  // namespace

KImpulseResponse KReadImpulseResponse(const KString& path, double sampleRate) {
  SF_INFO info{};
  const std::unique_ptr<SNDFILE, int (*)(SNDFILE*)> file(sf_open(path.ToUtf8().c_str(), SFM_READ, &info), &sf_close);
  if (!file) Refuse("The impulse response {0} could not be opened as a sound file.", path);
  if (info.frames <= 0 || info.channels <= 0 || info.samplerate <= 0) Refuse("The impulse response {0} holds no sound.", path);
  if (static_cast<double>(info.frames) > KImpulseResponse::kMaxSeconds * info.samplerate)
    Refuse("The impulse response {0} is longer than 30 seconds.", path);
  std::vector<float> frames(static_cast<size_t>(info.frames) * static_cast<size_t>(info.channels));
  const sf_count_t read = sf_readf_float(file.get(), frames.data(), info.frames);
  if (read <= 0) Refuse("The impulse response {0} could not be read.", path);

  KImpulseResponse response;
  response.sampleRate = info.samplerate;
  response.channels.assign(static_cast<size_t>(info.channels), std::vector<float>(static_cast<size_t>(read)));
  for (sf_count_t i = 0; i < read; ++i)
    for (int c = 0; c < info.channels; ++c)
      response.channels[static_cast<size_t>(c)][static_cast<size_t>(i)] = frames[static_cast<size_t>(i * info.channels + c)];
  return KResampleImpulseResponse(response, sampleRate);
}

KImpulseResponse KResampleImpulseResponse(const KImpulseResponse& response, double sampleRate) {
  if (response.sampleRate == sampleRate || response.Length() == 0) return response;
  const double ratio = sampleRate / response.sampleRate;
  // An impulse response is a filter: resampled, its taps are scaled by the inverse ratio so that
  // its frequency response (and its loudness) stays the same.
  const auto scale = static_cast<float>(1.0 / ratio);
  KImpulseResponse out;
  out.sampleRate = sampleRate;
  for (const std::vector<float>& channel : response.channels) {
    std::vector<float> resampled(static_cast<size_t>(std::ceil(static_cast<double>(channel.size()) * ratio)) + 1);
    SRC_DATA data{};
    data.data_in = channel.data();
    data.input_frames = static_cast<long>(channel.size());
    data.data_out = resampled.data();
    data.output_frames = static_cast<long>(resampled.size());
    data.src_ratio = ratio;
    if (const int error = src_simple(&data, SRC_SINC_BEST_QUALITY, 1); error != 0)
      throw KException(KFormatText(KString("The impulse response could not be resampled: {0}."), KString::FromUtf8(src_strerror(error))));
    resampled.resize(static_cast<size_t>(data.output_frames_gen));
    for (float& tap : resampled) tap *= scale;
    out.channels.push_back(std::move(resampled));
  }
  return out;
}

std::vector<double> KImpulseEnvelope(const KImpulseResponse& response, int32_t slices) {
  std::vector<double> peaks(static_cast<size_t>(std::max(slices, 0)), 0.0);
  const int64_t length = response.Length();
  if (peaks.empty() || length == 0) return std::vector<double>(peaks.size(), -180.0);
  for (const std::vector<float>& channel : response.channels)
    for (int64_t i = 0; i < std::min<int64_t>(length, static_cast<int64_t>(channel.size())); ++i) {
      double& peak = peaks[static_cast<size_t>(i * slices / length)];
      peak = std::max(peak, static_cast<double>(std::fabs(channel[static_cast<size_t>(i)])));
    }
  const double loudest = *std::max_element(peaks.begin(), peaks.end());
  for (double& peak : peaks) peak = peak > 0.0 && loudest > 0.0 ? std::max(20.0 * std::log10(peak / loudest), -180.0) : -180.0;
  return peaks;
}
