#pragma once

#include <string>

// The sample formats an output may hold, as the command line names them.
enum class KSampleFormat { kDefault, kInt16, kInt24, kInt32, kFloat32, kFloat64 };

// "s16", "s24", "s32", "f32" or "f64"; an error naming them otherwise.
KSampleFormat KParseSampleFormat(const std::string& name);
// The sample format of a libsndfile format word, kDefault for any other encoding (Vorbis, MP3, 8 bits).
KSampleFormat KSampleFormatOf(int fileFormat);
// Bits of an integer format, 0 for floating point.
int KIntegerBits(KSampleFormat format) noexcept;

// The libsndfile format word for a container ("wav", "flac", "aiff", "caf", "w64", "au",
// "ogg") and a sample format. kDefault becomes `preferred` where the container holds it, else
// the container's own default (s24 for FLAC, f32 elsewhere); a format the container cannot
// hold is an error naming both.
int KFileFormat(const std::string& container, KSampleFormat format, KSampleFormat preferred);
// The container named by a path's extension; an error naming the types otherwise.
std::string KContainerOfPath(const std::string& path);
