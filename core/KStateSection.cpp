#include "core/KStateSection.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <string>

#include "core/KAudioPlugin.h"
#include "kernel/KFormat.h"

namespace {
// The whole text must be the number: a document's "12abc" is no value, not 12.
template <class T>
bool ParseWhole(std::string_view text, T& value) noexcept {
  const char* end = text.data() + text.size();
  const auto result = std::from_chars(text.data(), end, value);
  return result.ec == std::errc() && result.ptr == end;
}

template <class T>
bool ParseWhole(const KString& text, T& value) {
  return ParseWhole(std::string_view(text.ToUtf8()), value);
}

template <class T>
bool Equal(const T& a, const T& b) noexcept {
  return a == b;
}
bool Equal(const KArray<int32_t>& a, const KArray<int32_t>& b) noexcept {
  return a.Count() == b.Count() && std::equal(a.begin(), a.end(), b.begin());
}

// Infinities and NaN are never settings.
bool ReadFinite(const KString& text, double& value) { return ParseWhole(text, value) && std::isfinite(value); }
}  // namespace

bool KStateSection::Storing() const noexcept { return (flags_ & KAudioPlugin::kStore) != 0; }

template <class T, class Write, class Read>
void KStateSection::Value(const KString& name, T& value, const T& fallback, Write&& write, Read&& read) {
  if (Storing()) {
    if (!Equal(value, fallback)) element_.SetAttribute(name, write(value));
    else if (flags_ & KAudioPlugin::kRemoveDefaults) element_.RemoveAttribute(name);
    return;
  }
  const KString* text = element_.FindAttribute(name);
  T parsed = fallback;
  value = text && read(*text, parsed) ? std::move(parsed) : fallback;
}

void KStateSection::Flag(const KString& name, bool& value, bool fallback) {
  Value(
      name, value, fallback, [](bool v) { return v ? KString("1") : KString("0"); },
      [](const KString& text, bool& v) {
        int32_t number;
        if (!ParseWhole(text, number)) return false;
        v = number != 0;
        return true;
      });
}

void KStateSection::Integer(const KString& name, int32_t& value, int32_t fallback) {
  Value(
      name, value, fallback, [](int32_t v) { return KFormatText("{0}", v); },
      [](const KString& text, int32_t& v) { return ParseWhole(text, v); });
}

void KStateSection::Unsigned(const KString& name, uint32_t& value, uint32_t fallback) {
  Value(
      name, value, fallback, [](uint32_t v) { return KFormatText("{0}", v); },
      [](const KString& text, uint32_t& v) { return ParseWhole(text, v); });
}

void KStateSection::Number(const KString& name, double& value, double fallback) {
  Value(
      name, value, fallback, [](double v) { return KFormatText("{0}", v); },
      ReadFinite);
}

double KStateSection::ReadNumber(const Element& element, const KString& name, double fallback) {
  const KString* text = element.FindAttribute(name);
  double value;
  return text && ReadFinite(*text, value) ? value : fallback;
}

void KStateSection::ExactNumber(const KString& name, double& value, double fallback) {
  Value(
      name, value, fallback,
      [](double v) {
        char text[32];
        const auto result = std::to_chars(text, text + sizeof text, v);
        return KString::Widen(text, static_cast<size_t>(result.ptr - text));
      },
      ReadFinite);
}

void KStateSection::Text(const KString& name, KString& value, const KString& fallback) {
  Value(
      name, value, fallback, [](const KString& v) { return v; },
      [](const KString& text, KString& v) {
        v = text;
        return true;
      });
}

void KStateSection::Choice(const KString& name, int32_t& value, int32_t fallback, std::span<const char* const> texts) {
  Value(
      name, value, fallback,
      [texts](int32_t v) { return v >= 0 && static_cast<size_t>(v) < texts.size() ? KString::Static(texts[v]) : KString(); },
      [texts](const KString& text, int32_t& v) {
        for (size_t i = 0; i < texts.size(); ++i) {
          if (text == KString::Static(texts[i])) {
            v = static_cast<int32_t>(i);
            return true;
          }
        }
        return false;
      });
}

void KStateSection::IntegerPair(const KString& name, Pair& value, const Pair& fallback) {
  Value(
      name, value, fallback, [](const Pair& v) { return KFormatText("{0},{1}", v.first, v.second); },
      [](const KString& text, Pair& v) {
        const std::string s = text.ToUtf8();
        const size_t comma = s.find(',');
        const std::string_view whole(s);
        return comma != std::string::npos && ParseWhole(whole.substr(0, comma), v.first) &&
               ParseWhole(whole.substr(comma + 1), v.second);
      });
}

void KStateSection::IntegerList(const KString& name, KArray<int32_t>& value) {
  Value(
      name, value, KArray<int32_t>(),
      [](const KArray<int32_t>& v) {
        KString text;
        for (int32_t i = 0; i < v.Count(); ++i) {
          if (i > 0) text.Append(u';');
          text.Append(KFormatText("{0}", v[i]));
        }
        return text;
      },
      [](const KString& text, KArray<int32_t>& v) {
        const std::string s = text.ToUtf8();
        std::string_view rest(s);
        while (true) {
          const size_t semicolon = rest.find(';');
          int32_t item;
          if (!ParseWhole(rest.substr(0, semicolon), item)) return false;
          v.Append(item);
          if (semicolon == std::string_view::npos) return true;
          rest.remove_prefix(semicolon + 1);
        }
      });
}
