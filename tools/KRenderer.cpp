#include "tools/KRenderer.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <iterator>
#include <random>

#include "hosts/common/KHostRamp.h"
#include "tools/KCliArguments.h"

namespace {

constexpr int32_t kMaxBlock = 512;

// Planar channel buffers for one block, filled from an interleaved source (silence past its end).
class BlockBuffers {
public:
  BlockBuffers(int32_t channels, int32_t frames) : planes_(static_cast<size_t>(channels), std::vector<float>(static_cast<size_t>(frames))) {
    for (auto& plane : planes_) pointers_.push_back(plane.data());
  }
  float* const* Pointers() noexcept { return pointers_.data(); }
  std::vector<float>& Plane(int32_t channel) noexcept { return planes_[static_cast<size_t>(channel)]; }
  int32_t Channels() const noexcept { return static_cast<int32_t>(planes_.size()); }

  // Reads n frames of `source` into the first `channels` planes; a source with fewer channels
  // repeats its last. The other planes are left as they are.
  void Fill(KAudioSource& source, int32_t n, std::vector<float>& scratch, int32_t channels) {
    const int32_t sourceChannels = source.Channels();
    scratch.resize(static_cast<size_t>(n * sourceChannels));
    const int64_t read = source.Read(scratch.data(), n);
    for (int32_t c = 0; c < channels; ++c) {
      const int32_t from = std::min(c, sourceChannels - 1);
      float* plane = pointers_[static_cast<size_t>(c)];
      for (int64_t i = 0; i < read; ++i) plane[i] = scratch[static_cast<size_t>(i * sourceChannels + from)];
      std::fill(plane + read, plane + n, 0.0f);
    }
  }

private:
  std::vector<std::vector<float>> planes_;
  std::vector<float*> pointers_;
};

// A lane's break points at whole sample positions.
struct SampleLane {
  int32_t parameter;
  std::vector<std::pair<int64_t, double>> corners;
};

SampleLane ToSamples(const KAutomationLane& lane, double rate) {
  SampleLane samples{lane.parameter, {}};
  for (const KAutomationLane::Point& point : lane.points) samples.corners.emplace_back(std::llround(point.seconds * rate), point.normalized);
  return samples;
}

// The lane over the block [start, start + n) as a host's points: the corner at or before the
// block start, every corner inside, and the first at or after its end, each at its own position.
// So every segment, and every value on it, is the same whatever the block size. Before its
// first corner and after its last the lane holds its value.
void AddBlockRamp(KAudioPlugin& plugin, const SampleLane& lane, int64_t start, int32_t n) {
  // Offsets far beyond a block (hours of audio) keep their sign and stay far.
  const auto offset = [start](int64_t at) { return static_cast<int32_t>(std::clamp<int64_t>(at - start, -(1 << 30), 1 << 30)); };
  const auto& c = lane.corners;
  const auto after = std::upper_bound(c.begin(), c.end(), start, [](int64_t at, const auto& corner) { return at < corner.first; });
  KHostRamp ramp(plugin, lane.parameter);
  if (after == c.begin()) ramp.Add(0, c.front().second);
  else ramp.Add(offset(std::prev(after)->first), std::prev(after)->second);
  auto corner = after;
  for (; corner != c.end() && corner->first < start + n; ++corner) ramp.Add(offset(corner->first), corner->second);
  if (corner != c.end()) ramp.Add(offset(corner->first), corner->second);
  else ramp.Add(n, c.back().second);
  ramp.Commit();
}

class Progress {
public:
  explicit Progress(bool enabled) : enabled_(enabled), begun_(std::chrono::steady_clock::now()) {}
  void Show(double fraction) {
    if (!enabled_) return;
    const auto now = std::chrono::steady_clock::now();
    if (now - begun_ < std::chrono::seconds(1) || now - shown_ < std::chrono::milliseconds(100)) return;
    shown_ = now;
    const int filled = static_cast<int>(fraction * 40.0);
    std::fprintf(stderr, "\r[%-40.*s] %3d%%", filled, "########################################", static_cast<int>(fraction * 100.0));
    drawn_ = true;
  }
  ~Progress() {
    if (drawn_) std::fprintf(stderr, "\r%60s\r", "");
  }

private:
  bool enabled_;
  bool drawn_ = false;
  std::chrono::steady_clock::time_point begun_, shown_;
};

void Measure(const float* samples, int32_t n, double& peak, double& sumOfSquares) {
  for (int32_t i = 0; i < n; ++i) {
    peak = std::max(peak, static_cast<double>(std::fabs(samples[i])));
    sumOfSquares += static_cast<double>(samples[i]) * samples[i];
  }
}

}  // namespace

KRenderSummary KRender(KAudioPlugin& plugin, KAudioSource& input, KAudioFileWriter& output, const KRenderOptions& options) {
  const double rate = input.SampleRate();
  const int32_t inputs = plugin.InputChannelCount();
  const int32_t outputs = plugin.OutputChannelCount();
  const int32_t mainInputs = plugin.GetShape().inputBuses > 0 ? plugin.ChannelsPerBus() : 0;
  const int64_t latency = plugin.TotalLatency();
  const int64_t frames = input.Frames() + static_cast<int64_t>(std::llround(options.tailSeconds * rate));

  BlockBuffers in(std::max(inputs, 1), kMaxBlock), out(outputs, kMaxBlock), sideChain(inputs - mainInputs, kMaxBlock);
  std::vector<float> scratch, interleaved(static_cast<size_t>(kMaxBlock * outputs));
  std::vector<SampleLane> lanes;
  for (const KAutomationLane& lane : options.automation) lanes.push_back(ToSamples(lane, rate));
  std::mt19937 randomSizes(20261121u);
  std::uniform_int_distribution<int32_t> anySize(1, kMaxBlock);
  Progress progress(options.showProgress);
  KRenderSummary summary;
  double inputSquares = 0.0, outputSquares = 0.0;

  const auto begun = std::chrono::steady_clock::now();
  for (int64_t position = 0; position < frames + latency;) {
    const int32_t n = static_cast<int32_t>(std::min<int64_t>(options.blockSize > 0 ? options.blockSize : anySize(randomSizes), frames + latency - position));
    // The side-chain bus stays silent unless a side-chain file feeds it.
    in.Fill(input, n, scratch, mainInputs);
    for (int32_t c = 0; c < mainInputs; ++c) Measure(in.Plane(c).data(), n, summary.inputPeak, inputSquares);
    if (options.sideChain) {
      sideChain.Fill(*options.sideChain, n, scratch, sideChain.Channels());
      for (int32_t c = 0; c < sideChain.Channels(); ++c) std::copy_n(sideChain.Plane(c).data(), n, in.Plane(mainInputs + c).data());
    }
    for (const SampleLane& lane : lanes) AddBlockRamp(plugin, lane, position, n);
    plugin.ProcessHostBlock(inputs > 0 ? in.Pointers() : nullptr, out.Pointers(), n);

    // Drop the first `latency` frames so that the output lines up with the input.
    const int64_t skip = std::clamp<int64_t>(latency - position, 0, n);
    const int32_t keep = static_cast<int32_t>(n - skip);
    for (int32_t c = 0; c < outputs; ++c) {
      const float* plane = out.Plane(c).data() + skip;
      Measure(plane, keep, summary.outputPeak, outputSquares);
      for (int32_t i = 0; i < keep; ++i) interleaved[static_cast<size_t>(i * outputs + c)] = plane[i];
    }
    output.Write(interleaved.data(), keep);
    position += n;
    progress.Show(static_cast<double>(position) / static_cast<double>(frames + latency));
  }
  const double elapsed = std::chrono::duration<double>(std::chrono::steady_clock::now() - begun).count();
  summary.seconds = static_cast<double>(frames) / rate;
  summary.inputRms = std::sqrt(inputSquares / std::max<double>(1.0, static_cast<double>(frames) * std::max(mainInputs, 1)));
  summary.outputRms = std::sqrt(outputSquares / std::max<double>(1.0, static_cast<double>(frames) * outputs));
  summary.realtimeFactor = elapsed > 0.0 ? summary.seconds / elapsed : 0.0;
  return summary;
}
