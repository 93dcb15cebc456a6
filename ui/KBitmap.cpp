#include "ui/KBitmap.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <cstring>
#include <utility>

#include "kernel/KException.h"

namespace {
std::atomic<uint64_t> gNextIdentity{1};

// Beyond this an image is certainly not a skin or a screenshot; it also keeps every byte
// offset within 32 bits of pixels times four.
constexpr int64_t kMaxPixels = int64_t{1} << 28;

uint32_t* AllocatePixels(int32_t width, int32_t height) {
  const int64_t count = int64_t{width} * height;
  if (count == 0) return nullptr;
  if (count > kMaxPixels) throw KException("The image is too large.");
  auto* pixels = static_cast<uint32_t*>(std::calloc(static_cast<size_t>(count), 4));
  if (!pixels) throw KException("The image is too large.");
  return pixels;
}
}  // namespace

KBitmap::KBitmap() noexcept : identity_(gNextIdentity++) {}

KBitmap::KBitmap(int32_t width, int32_t height) : identity_(gNextIdentity++) {
  width = std::max(width, 0);
  height = std::max(height, 0);
  pixels_ = AllocatePixels(width, height);
  if (pixels_) {
    width_ = width;
    height_ = height;
  }
}

KBitmap::KBitmap(const KBitmap& other) : KBitmap(other.width_, other.height_) {
  if (pixels_) std::memcpy(pixels_, other.pixels_, static_cast<size_t>(width_) * height_ * 4);
}

KBitmap::KBitmap(KBitmap&& other) noexcept
    : width_(std::exchange(other.width_, 0)),
      height_(std::exchange(other.height_, 0)),
      pixels_(std::exchange(other.pixels_, nullptr)),
      identity_(std::exchange(other.identity_, gNextIdentity++)) {}

KBitmap& KBitmap::operator=(KBitmap other) noexcept {
  std::swap(width_, other.width_);
  std::swap(height_, other.height_);
  std::swap(pixels_, other.pixels_);
  identity_ = gNextIdentity++;
  return *this;
}

KBitmap::~KBitmap() { std::free(pixels_); }

void KBitmap::MarkChanged() noexcept { identity_ = gNextIdentity++; }

KBitmap KBitmap::Copy(const KRect& source) const {
  const KRect r{std::max(source.left, 0), std::max(source.top, 0), std::min(source.right, width_ - 1),
                std::min(source.bottom, height_ - 1)};
  if (r.IsEmpty()) return {};
  KBitmap copy(static_cast<int32_t>(r.Width()), static_cast<int32_t>(r.Height()));
  for (int32_t y = 0; y < copy.height_; ++y)
    std::memcpy(copy.Row(y), Row(r.top + y) + r.left, static_cast<size_t>(copy.width_) * 4);
  return copy;
}

void KBitmap::Fill(KColor color) noexcept { std::fill_n(pixels_, static_cast<size_t>(width_) * height_, color); }
