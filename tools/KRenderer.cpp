#include "tools/KRenderer.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <deque>
#include <iterator>
#include <optional>
#include <random>

#include "hosts/common/KHostRamp.h"
#include "tools/KCliArguments.h"

namespace {

constexpr int32_t kMaxBlock = 512;

// Frames read from a source per call: large reads keep the system's share of a render small
// whatever the host block size.
constexpr int64_t kChunkFrames = 65536;

// Planar channel buffers for one block.
class BlockBuffers {
public:
  BlockBuffers(int32_t channels, int32_t frames) : planes_(static_cast<size_t>(channels), std::vector<float>(static_cast<size_t>(frames))) {
    for (auto& plane : planes_) pointers_.push_back(plane.data());
  }
  float* const* Pointers() noexcept { return pointers_.data(); }
  float* Plane(int32_t channel) noexcept { return pointers_[static_cast<size_t>(channel)]; }
  int32_t Channels() const noexcept { return static_cast<int32_t>(planes_.size()); }

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

// A source read in large chunks and handed out block by block as planes.
class ChunkedSource {
public:
  explicit ChunkedSource(KAudioSource& source) : source_(source), chunk_(static_cast<size_t>(kChunkFrames * source.Channels())) {}

  // Puts the next n frames into planes `first` to `first + count - 1` of `into` (a source with
  // fewer channels repeats its last), silence past the source's end; answers how many frames
  // came from the source.
  int32_t Fill(BlockBuffers& into, int32_t first, int32_t count, int32_t n) {
    const int32_t channels = source_.Channels();
    int32_t done = 0;
    while (done < n) {
      if (at_ == held_) {
        if (ended_) break;
        held_ = source_.Read(chunk_.data(), kChunkFrames), at_ = 0;
        ended_ = held_ < kChunkFrames;
        if (held_ == 0) break;
      }
      const int32_t take = static_cast<int32_t>(std::min<int64_t>(n - done, held_ - at_));
      for (int32_t c = 0; c < count; ++c) {
        const float* from = chunk_.data() + at_ * channels + std::min(c, channels - 1);
        float* plane = into.Plane(first + c) + done;
        for (int32_t i = 0; i < take; ++i) plane[i] = from[i * channels];
      }
      at_ += take, done += take;
    }
    for (int32_t c = 0; c < count; ++c) std::fill(into.Plane(first + c) + done, into.Plane(first + c) + n, 0.0f);
    return done;
  }

private:
  KAudioSource& source_;
  std::vector<float> chunk_;  // interleaved
  int64_t held_ = 0, at_ = 0;  // frames in the chunk, frames handed out of it
  bool ended_ = false;
};

// One plug-in of the chain with its buffers.
struct Stage {
  Stage(const KRenderStage& from, double rate)
      : plugin(*from.plugin),
        mainInputs(plugin.GetShape().inputBuses > 0 ? plugin.ChannelsPerBus() : 0),
        in(std::max(plugin.InputChannelCount(), 1), kMaxBlock),
        out(plugin.OutputChannelCount(), kMaxBlock) {
    for (const KAutomationLane& lane : from.automation) lanes.push_back(ToSamples(lane, rate));
    if (from.sideChain) sideChain.emplace(*from.sideChain);
  }
  KAudioPlugin& plugin;
  std::vector<SampleLane> lanes;
  int32_t mainInputs;
  BlockBuffers in, out;
  std::optional<ChunkedSource> sideChain;  // else the side-chain bus stays silent
};

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

// Four running peaks and sums side by side: one chain of dependent additions through every
// sample took a third of a whole render.
void Measure(const float* samples, int32_t n, double& peak, double& sumOfSquares) {
  constexpr int32_t kLanes = 4;
  float peaks[kLanes] = {};
  double sums[kLanes] = {};
  int32_t i = 0;
  for (; i + kLanes <= n; i += kLanes)
    for (int32_t k = 0; k < kLanes; ++k) {
      peaks[k] = std::max(peaks[k], std::fabs(samples[i + k]));
      sums[k] += static_cast<double>(samples[i + k]) * samples[i + k];
    }
  for (; i < n; ++i) {
    peaks[0] = std::max(peaks[0], std::fabs(samples[i]));
    sums[0] += static_cast<double>(samples[i]) * samples[i];
  }
  peak = std::max({peak, static_cast<double>(peaks[0]), static_cast<double>(peaks[1]), static_cast<double>(peaks[2]), static_cast<double>(peaks[3])});
  sumOfSquares += (sums[0] + sums[1]) + (sums[2] + sums[3]);
}

}  // namespace

KRenderSummary KRender(std::span<const KRenderStage> stages, KAudioSource& input, KAudioFileWriter& output, const KRenderOptions& options) {
  const double rate = input.SampleRate();
  std::deque<Stage> chain;  // stages hold references: built in place, never moved
  int64_t latency = 0;
  for (const KRenderStage& stage : stages) {
    chain.emplace_back(stage, rate);
    latency += stage.plugin->TotalLatency();
  }
  Stage& first = chain.front();
  Stage& last = chain.back();
  const int32_t outputs = last.plugin.OutputChannelCount();
  const int64_t tail = static_cast<int64_t>(std::llround(options.tailSeconds * rate));
  ChunkedSource source(input);
  std::vector<float> interleaved(static_cast<size_t>(kMaxBlock * outputs));
  std::mt19937 randomSizes(20261121u);
  std::uniform_int_distribution<int32_t> anySize(1, kMaxBlock);
  Progress progress(options.showProgress && input.Frames() >= 0);
  KRenderSummary summary;
  double inputSquares = 0.0, outputSquares = 0.0;
  int64_t inputFrames = -1;  // known once the input has ended

  const auto begun = std::chrono::steady_clock::now();
  for (int64_t position = 0; inputFrames < 0 || position < inputFrames + tail + latency;) {
    int32_t n = options.blockSize > 0 ? options.blockSize : anySize(randomSizes);
    if (inputFrames >= 0) n = static_cast<int32_t>(std::min<int64_t>(n, inputFrames + tail + latency - position));
    const int32_t got = source.Fill(first.in, 0, first.mainInputs, n);
    if (got < n && inputFrames < 0) {
      inputFrames = position + got;
      n = static_cast<int32_t>(std::min<int64_t>(n, inputFrames + tail + latency - position));
      if (n == 0) break;
    }
    for (int32_t c = 0; c < first.mainInputs; ++c) Measure(first.in.Plane(c), n, summary.inputPeak, inputSquares);
    for (size_t s = 0; s < chain.size(); ++s) {
      Stage& stage = chain[s];
      if (s > 0) {  // the main bus hears the stage before; a mono output feeds both channels
        BlockBuffers& before = chain[s - 1].out;
        for (int32_t c = 0; c < stage.mainInputs; ++c) std::copy_n(before.Plane(std::min(c, before.Channels() - 1)), n, stage.in.Plane(c));
      }
      if (stage.sideChain) stage.sideChain->Fill(stage.in, stage.mainInputs, stage.in.Channels() - stage.mainInputs, n);
      for (const SampleLane& lane : stage.lanes) AddBlockRamp(stage.plugin, lane, position, n);
      stage.plugin.ProcessHostBlock(stage.plugin.InputChannelCount() > 0 ? stage.in.Pointers() : nullptr, stage.out.Pointers(), n);
    }

    // Drop the first `latency` frames so that the output lines up with the input.
    const int64_t skip = std::clamp<int64_t>(latency - position, 0, n);
    const int32_t keep = static_cast<int32_t>(n - skip);
    for (int32_t c = 0; c < outputs; ++c) {
      const float* plane = last.out.Plane(c) + skip;
      Measure(plane, keep, summary.outputPeak, outputSquares);
      for (int32_t i = 0; i < keep; ++i) interleaved[static_cast<size_t>(i * outputs + c)] = plane[i];
    }
    output.Write(interleaved.data(), keep);
    position += n;
    progress.Show(static_cast<double>(position) / static_cast<double>(input.Frames() + tail + latency));
  }
  const int64_t frames = inputFrames + tail;
  const double elapsed = std::chrono::duration<double>(std::chrono::steady_clock::now() - begun).count();
  summary.seconds = static_cast<double>(frames) / rate;
  summary.inputRms = std::sqrt(inputSquares / std::max<double>(1.0, static_cast<double>(frames) * std::max(first.mainInputs, 1)));
  summary.outputRms = std::sqrt(outputSquares / std::max<double>(1.0, static_cast<double>(frames) * outputs));
  summary.realtimeFactor = elapsed > 0.0 ? summary.seconds / elapsed : 0.0;
  return summary;
}
