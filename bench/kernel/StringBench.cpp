#include <benchmark/benchmark.h>

#include <string>

#include "kernel/KString.h"

// Each KString measurement sits beside the same work on std::u16string, for a short text
// (inline in a KString) and a long one (a shared heap block).
namespace {

constexpr int kShort = 40;
constexpr int kLong = 400;
constexpr char kPiece[] = "0123456789";

std::string Letters(int count) {
  std::string text;
  for (int i = 0; i < count; ++i) text += static_cast<char>('a' + i % 26);
  return text;
}

void BM_StringCopy(benchmark::State& state, int length) {
  const KString source = KString::FromUtf8(Letters(length));
  for (auto _ : state) {
    KString copy = source;
    benchmark::DoNotOptimize(copy);
  }
}

void BM_Reference_U16StringCopy(benchmark::State& state, int length) {
  const std::string letters = Letters(length);
  const std::u16string source(letters.begin(), letters.end());
  for (auto _ : state) {
    std::u16string copy = source;
    benchmark::DoNotOptimize(copy);
  }
}

// Builds the text from ten-character pieces.
void BM_StringAppend(benchmark::State& state, int length) {
  const KString piece = kPiece;
  for (auto _ : state) {
    KString text;
    for (int n = 0; n < length; n += 10) text.Append(piece);
    benchmark::DoNotOptimize(text);
  }
}

void BM_Reference_U16StringAppend(benchmark::State& state, int length) {
  const std::u16string piece = u"0123456789";
  for (auto _ : state) {
    std::u16string text;
    for (int n = 0; n < length; n += 10) text.append(piece);
    benchmark::DoNotOptimize(text);
  }
}

void BM_StringAppendCharacter(benchmark::State& state, int length) {
  for (auto _ : state) {
    KString text;
    for (int n = 0; n < length; ++n) text.Append(static_cast<char16_t>('a' + n % 26));
    benchmark::DoNotOptimize(text);
  }
}

void BM_Reference_U16StringAppendCharacter(benchmark::State& state, int length) {
  for (auto _ : state) {
    std::u16string text;
    for (int n = 0; n < length; ++n) text.push_back(static_cast<char16_t>('a' + n % 26));
    benchmark::DoNotOptimize(text);
  }
}

}  // namespace

BENCHMARK_CAPTURE(BM_StringCopy, Short, kShort);
BENCHMARK_CAPTURE(BM_Reference_U16StringCopy, Short, kShort);
BENCHMARK_CAPTURE(BM_StringCopy, Long, kLong);
BENCHMARK_CAPTURE(BM_Reference_U16StringCopy, Long, kLong);
BENCHMARK_CAPTURE(BM_StringAppend, Short, kShort);
BENCHMARK_CAPTURE(BM_Reference_U16StringAppend, Short, kShort);
BENCHMARK_CAPTURE(BM_StringAppend, Long, kLong);
BENCHMARK_CAPTURE(BM_Reference_U16StringAppend, Long, kLong);
BENCHMARK_CAPTURE(BM_StringAppendCharacter, Short, kShort);
BENCHMARK_CAPTURE(BM_Reference_U16StringAppendCharacter, Short, kShort);
BENCHMARK_CAPTURE(BM_StringAppendCharacter, Long, kLong);
BENCHMARK_CAPTURE(BM_Reference_U16StringAppendCharacter, Long, kLong);
