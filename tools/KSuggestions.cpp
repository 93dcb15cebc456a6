#include "tools/KSuggestions.h"

#include <algorithm>
#include <cctype>
#include <utility>

namespace {

size_t EditDistance(const std::string& a, const std::string& b) {
  std::vector<size_t> row(b.size() + 1);
  for (size_t j = 0; j <= b.size(); ++j) row[j] = j;
  for (size_t i = 1; i <= a.size(); ++i) {
    size_t diagonal = row[0];
    row[0] = i;
    for (size_t j = 1; j <= b.size(); ++j) {
      const size_t above = row[j];
      row[j] = std::min({row[j] + 1, row[j - 1] + 1, diagonal + (a[i - 1] == b[j - 1] ? 0 : 1)});
      diagonal = above;
    }
  }
  return row[b.size()];
}

}  // namespace

std::string KLowerCase(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(), [](unsigned char c) { return std::tolower(c); });
  return text;
}

std::string KSuggestions(const std::string& wanted, const std::vector<std::string>& known) {
  const std::string target = KLowerCase(wanted);
  std::vector<std::pair<size_t, std::string>> close;
  for (const std::string& candidate : known) {
    const std::string lower = KLowerCase(candidate);
    const size_t distance = EditDistance(target, lower);
    if (distance <= std::max<size_t>(2, target.size() / 3) || (!target.empty() && lower.find(target) != std::string::npos))
      close.emplace_back(distance, candidate);
  }
  std::stable_sort(close.begin(), close.end(), [](const auto& a, const auto& b) { return a.first < b.first; });
  if (close.empty()) return {};
  std::string text = " Did you mean ";
  for (size_t i = 0; i < close.size() && i < 3; ++i) text += (i ? ", " : "") + close[i].second;
  return text + "?";
}
