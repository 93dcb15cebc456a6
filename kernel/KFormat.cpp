#include "kernel/KFormat.h"

#include <algorithm>
#include <charconv>
#include <cmath>

#include "kernel/KException.h"

namespace {

// Collects literal characters and hands them to the text in runs rather than one by one.
class Staging {
public:
  explicit Staging(KString& text) : text_(text) {}
  ~Staging() = default;
  void Put(char16_t c) {
    if (count_ == kSize) Flush();
    buffer_[count_++] = c;
  }
  void Flush() {
    if (count_ == 0) return;
    text_.AppendUtf16(buffer_, count_);
    count_ = 0;
  }
  int32_t Length() const { return text_.Length() + count_; }

private:
  static constexpr int32_t kSize = 255;
  KString& text_;
  char16_t buffer_[kSize];
  int32_t count_ = 0;
};

// An optional "-" and decimal digits from at most `maxChars` characters at units[i].
template <class Unit>
int32_t ReadNumber(const Unit* units, int32_t length, int32_t& i, int32_t maxChars) {
  bool negative = false;
  int32_t value = 0;
  for (int32_t k = 0; k < maxChars && i < length; ++k, ++i) {
    const uint32_t c = static_cast<std::make_unsigned_t<Unit>>(units[i]);
    if (k == 0 && c == '-') {
      negative = true;
    } else if (c >= '0' && c <= '9') {
      value = value * 10 + static_cast<int32_t>(c - '0');
    } else {
      break;
    }
  }
  return negative ? -value : value;
}

char* WriteDigits(uint64_t value, bool hexadecimal, char* end) {
  const char* digits = "0123456789ABCDEF";
  const uint64_t base = hexadecimal ? 16 : 10;
  do {
    *--end = digits[value % base];
    value /= base;
  } while (value != 0);
  return end;
}

}  // namespace

KFormat::KFormat(const KString& pattern) {
  // Most patterns of the system are plain messages: keep those as they are, without a copy.
  const bool plain = pattern.VisitUnits([](const auto* units, int32_t length) {
    for (int32_t i = 0; i < length; ++i)
      if (units[i] == '{' || units[i] == '}') return false;
    return true;
  });
  if (plain) {
    literal_ = pattern;
    return;
  }
  pattern.VisitUnits([&](const auto* units, int32_t length) {
    using Unit = std::remove_cv_t<std::remove_pointer_t<decltype(units)>>;
    auto at = [&](int32_t i) -> char16_t {
      return i < length ? static_cast<char16_t>(static_cast<std::make_unsigned_t<Unit>>(units[i])) : 0;
    };
    Staging staging(literal_);
    int32_t i = 0;
    while (i < length) {
      const char16_t c = at(i);
      if (c == '}') {  // "}x" yields x; a lone "}" at the end yields nothing
        if (i + 1 < length) staging.Put(at(i + 1));
        i += 2;
        continue;
      }
      if (c != '{') {  // a run of plain text goes over in one piece
        int32_t end = i + 1;
        while (end < length && at(end) != '{' && at(end) != '}') ++end;
        staging.Flush();
        literal_.AppendPart(pattern, i, end - i);
        i = end;
        continue;
      }
      if (at(i + 1) == '{') {
        staging.Put('{');
        i += 2;
        continue;
      }
      ++i;
      const int32_t index = ReadNumber(units, length, i, 3);
      Slot slot{static_cast<uint32_t>(staging.Length()), 0, 0, ' ', -1, 0};
      for (;;) {
        if (i >= length) throw KException("Formatting string ends in an argument specification.");
        const char16_t option = at(i++);
        if (option == '}') break;
        switch (option) {
          case ' ':
          case '0':
            slot.fill = static_cast<uint8_t>(option);
            slot.width = static_cast<int8_t>(ReadNumber(units, length, i, 2));
            break;
          case '.': slot.precision = static_cast<int8_t>(ReadNumber(units, length, i, 2)); break;
          case '+': slot.flags |= kPlusSign; break;
          case 'x': slot.flags |= kHexadecimal; break;
          default: break;  // separators such as ";" and stray digits carry no meaning
        }
      }
      // Indices outside the 32 slots have nowhere to go; they produce nothing.
      if (index < 0 || index >= kMaxSlots) continue;
      for (int32_t s = 0; s < kMaxSlots; ++s)
        if (used_[s] && s != index && slots_[s].position == slot.position) ++slot.before;
      slots_[index] = slot;
      used_[index] = true;
      if (index + 1 > slotCount_) slotCount_ = index + 1;
    }
    staging.Flush();
  });
}

void KFormat::Store(KString rendering) {
  if (current_ < kMaxSlots) rendered_[current_] = std::move(rendering);
  ++current_;
}

KFormat& KFormat::Arg(const KString& text) {
  Store(text);
  return *this;
}

// Pads a rendering that carries no sign with the sign and fill of the current slot. The
// caller says whether the value is negative or positive; a value shown as zero is neither.
KFormat& KFormat::Place(const char* text, int32_t length, bool negative, bool positive) {
  if (current_ >= kMaxSlots) {
    ++current_;
    return *this;
  }
  const Slot& slot = slots_[current_];
  const char sign = negative ? '-' : (positive && (slot.flags & kPlusSign) ? '+' : 0);
  const int32_t used = length + (sign ? 1 : 0);
  const int32_t width = slot.width < 0 ? -slot.width : slot.width;
  const int32_t pad = width > used ? width - used : 0;
  KString out;
  out.Reserve(used + pad);
  // Zeros go between sign and digits; blanks before the sign; left alignment pads with blanks
  // after the number so that the value itself never changes.
  if (slot.width > 0 && slot.fill != '0')
    for (int32_t k = 0; k < pad; ++k) out.Append(u' ');
  if (sign) out.Append(static_cast<char16_t>(sign));
  if (slot.width > 0 && slot.fill == '0')
    for (int32_t k = 0; k < pad; ++k) out.Append(u'0');
  for (int32_t k = 0; k < length; ++k) out.Append(static_cast<char16_t>(text[k]));
  if (slot.width < 0)
    for (int32_t k = 0; k < pad; ++k) out.Append(u' ');
  Store(std::move(out));
  return *this;
}

KFormat& KFormat::ArgSigned(int64_t value) {
  const uint64_t magnitude = value < 0 ? 0 - static_cast<uint64_t>(value) : static_cast<uint64_t>(value);
  char buffer[24];
  char* end = buffer + sizeof(buffer);
  char* begin = WriteDigits(magnitude, CurrentFlags() & kHexadecimal, end);
  return Place(begin, static_cast<int32_t>(end - begin), value < 0, value > 0);
}

KFormat& KFormat::ArgUnsigned(uint64_t value) {
  char buffer[24];
  char* end = buffer + sizeof(buffer);
  char* begin = WriteDigits(value, CurrentFlags() & kHexadecimal, end);
  return Place(begin, static_cast<int32_t>(end - begin), false, value != 0);
}

KFormat& KFormat::ArgFloat(double value) {
  if (std::isnan(value)) return Place("nan", 3, false, false);
  const bool negative = std::signbit(value);
  const double magnitude = std::fabs(value);
  if (std::isinf(magnitude)) return Place("inf", 3, negative, !negative);
  const int precision = current_ < kMaxSlots ? slots_[current_].precision : -1;
  char buffer[309 + 1 + 99];  // the longest fixed rendering: DBL_MAX's 309 digits, a point, 99 decimals
  const auto result =
      std::to_chars(buffer, buffer + sizeof(buffer), magnitude, std::chars_format::fixed, precision < 0 ? 6 : precision);
  char* end = result.ptr;
  if (precision < 0) {
    while (end[-1] == '0') --end;
    if (end[-1] == '.') --end;
  }
  const bool shownAsZero = std::all_of(buffer, end, [](char c) { return c == '0' || c == '.'; });
  return Place(buffer, static_cast<int32_t>(end - buffer), negative && !shownAsZero, !negative && !shownAsZero);
}

KString KFormat::Text() const {
  // Slots in order of insertion position, those at one position in written order.
  int32_t order[kMaxSlots];
  int32_t count = 0;
  for (int32_t s = 0; s < slotCount_; ++s) {
    if (!used_[s]) continue;
    int32_t k = count++;
    while (k > 0 && (slots_[order[k - 1]].position > slots_[s].position ||
                     (slots_[order[k - 1]].position == slots_[s].position && slots_[order[k - 1]].before > slots_[s].before))) {
      order[k] = order[k - 1];
      --k;
    }
    order[k] = s;
  }
  if (count == 0) return literal_;
  int32_t total = literal_.Length();
  for (int32_t k = 0; k < count; ++k) total += rendered_[order[k]].Length();
  KString out;
  out.Reserve(total);
  int32_t copied = 0;
  for (int32_t k = 0; k < count; ++k) {
    const Slot& slot = slots_[order[k]];
    const int32_t position = static_cast<int32_t>(slot.position);
    out.AppendPart(literal_, copied, position - copied);
    copied = position;
    out.Append(rendered_[order[k]]);
  }
  out.AppendPart(literal_, copied, literal_.Length() - copied);
  return out;
}
