// Bitmaps: their memory layout, copies, PNG storing and loading, WebP loading and the messages
// for images that are missing or damaged.
#include <gtest/gtest.h>
#include <webp/encode.h>

#include "kernel/platform/KPlatform.h"
#include "tests/core/TraceCapture.h"
#include "ui/KBitmap.h"

namespace {
KBitmap Sample() {
  KBitmap b(5, 3);
  for (int32_t y = 0; y < 3; ++y)
    for (int32_t x = 0; x < 5; ++x) b.Row(y)[x] = KMakeColor(uint32_t(40 * x + 10), uint32_t(50 * y), uint32_t(x * 9), 200);
  return b;
}

bool SamePixels(const KBitmap& a, const KBitmap& b) {
  if (a.Width() != b.Width() || a.Height() != b.Height()) return false;
  return std::equal(a.Pixels(), a.Pixels() + size_t(a.Width()) * a.Height(), b.Pixels());
}

std::string WebP(const KBitmap& b) {
  uint8_t* out = nullptr;
  const size_t size = WebPEncodeLosslessBGRA(reinterpret_cast<const uint8_t*>(b.Pixels()), b.Width(), b.Height(), b.Width() * 4, &out);
  std::string bytes(reinterpret_cast<const char*>(out), size);
  WebPFree(out);
  return bytes;
}

const std::string kDamaged = "The image 'x' is damaged or not a PNG or WebP image.";

class BitmapFiles : public ::testing::Test {
protected:
  void SetUp() override { folder_ = KPlatform::CreateTemporaryFolder(); }
  void TearDown() override { KPlatform::RemoveFolderTree(folder_); }
  std::string folder_;
};
}  // namespace

TEST(Bitmap, PixelsAreBlueGreenRedAlphaInMemory) {
  KBitmap b(2, 1);
  b.Row(0)[1] = 0x80112233u;
  const auto* bytes = reinterpret_cast<const uint8_t*>(b.Pixels());
  EXPECT_EQ(bytes[4], 0x33);
  EXPECT_EQ(bytes[5], 0x22);
  EXPECT_EQ(bytes[6], 0x11);
  EXPECT_EQ(bytes[7], 0x80);
  EXPECT_EQ(b.Pixel(0, 0), 0u);  // new bitmaps are transparent black
  EXPECT_EQ(b.Bounds(), (KRect{0, 0, 1, 0}));
}

TEST(Bitmap, SizesAndIdentities) {
  EXPECT_EQ(KBitmap(-4, 7).Width(), 0);
  EXPECT_EQ(KBitmap(-4, 7).Pixels(), nullptr);
  EXPECT_TRUE(KBitmap(0, 0).Bounds().IsEmpty());
  EXPECT_EQ(KFailureOf([] { KBitmap(1 << 20, 1 << 20); }), "The image is too large.");
  KBitmap a = Sample();
  const KBitmap copy = a;
  EXPECT_TRUE(SamePixels(a, copy));
  EXPECT_NE(a.Identity(), copy.Identity());
  const uint64_t before = a.Identity();
  a.MarkChanged();
  EXPECT_NE(a.Identity(), before);
  // Copies of rectangles are cut to the bitmap.
  const KBitmap part = a.Copy({3, 1, 10, 10});
  EXPECT_EQ(part.Width(), 2);
  EXPECT_EQ(part.Height(), 2);
  EXPECT_EQ(part.Pixel(1, 1), a.Pixel(4, 2));
  EXPECT_EQ(a.Copy({7, 7, 9, 9}).Width(), 0);
}

TEST_F(BitmapFiles, StoredPNGLoadsBackWithEveryByte) {
  const KBitmap original = Sample();
  original.Store(folder_ + "a.png");
  EXPECT_TRUE(SamePixels(KBitmap::Load(folder_ + "a.png"), original));
  EXPECT_EQ(KFailureOf([] { KBitmap().Store("/nonexistent/x.png"); }), "An empty image cannot be stored.");
}

TEST(BitmapDecode, WebPLoadsLikeThePicture) {
  const KBitmap original = Sample();
  EXPECT_TRUE(SamePixels(KBitmap::Decode(WebP(original), "x"), original));
}

TEST_F(BitmapFiles, MissingDamagedAndForeignImagesGiveAClearMessage) {
  EXPECT_EQ(KFailureOf([&] { KBitmap::Load(folder_ + "none.png"); }),
            "Could not read the image '" + folder_ + "none.png' (no such file).");
  const std::string png = Sample().EncodePNG(), webp = WebP(Sample());
  const std::string cases[] = {
      png.substr(0, png.size() / 2),         // truncated PNG
      png.substr(0, 8),                      // PNG signature only
      webp.substr(0, webp.size() - 5),       // truncated WebP
      webp.substr(0, 12),                    // WebP header only
      "GIF89a and then some",                // another format
      "",                                    // empty file
  };
  for (const std::string& bytes : cases) EXPECT_EQ(KFailureOf([&] { KBitmap::Decode(bytes, "x"); }), kDamaged);
  // A flipped byte inside the compressed data: the checksum catches it.
  std::string corrupt = png;
  corrupt[corrupt.size() - 20] ^= 0x55;
  EXPECT_EQ(KFailureOf([&] { KBitmap::Decode(corrupt, "x"); }), kDamaged);
}

TEST(BitmapDecode, DamagedBytesAnywhereNeverCrash) {
  // Every decode of a damaged image either yields a bitmap or throws the message; under
  // AddressSanitizer this also proves no read or write outside the buffers.
  const KBitmap picture(37, 23);
  for (const std::string& image : {picture.EncodePNG(), WebP(KBitmap(37, 23))}) {
    uint32_t seed = 12345;
    for (int trial = 0; trial < 300; ++trial) {
      std::string bytes = image;
      for (int flips = 0; flips < 3; ++flips) {
        seed = seed * 1664525u + 1013904223u;
        bytes[seed % bytes.size()] = char(seed >> 24);
      }
      const std::string failure = KFailureOf([&] { KBitmap::Decode(bytes, "x"); });
      EXPECT_TRUE(failure == "(no failure)" || failure == kDamaged) << failure;
    }
  }
}
