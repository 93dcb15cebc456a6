#include "tools/KCliArguments.h"

#include <algorithm>
#include <utility>

#include "kernel/KException.h"

void KCliFail(const std::string& message) { throw KException(KString::FromUtf8(message)); }

KCliArguments::KCliArguments(std::span<char* const> words, std::string_view command,
                             std::initializer_list<std::string_view> withValue, std::initializer_list<std::string_view> flags) {
  auto named = [](std::initializer_list<std::string_view> names, std::string_view name) {
    return std::find(names.begin(), names.end(), name) != names.end();
  };
  // The short forms sox and ffmpeg users type.
  constexpr std::pair<std::string_view, std::string_view> kShort[] = {{"-t", "--type"}, {"-q", "--quiet"}};
  for (size_t i = 0; i < words.size(); ++i) {
    std::string_view word = words[i];
    for (const auto& [shortForm, longForm] : kShort)
      if (word == shortForm) word = longForm;
    if (word.size() < 3 || word.substr(0, 2) != "--") {
      positional_.emplace_back(word);
      continue;
    }
    std::string_view name = word.substr(2);
    std::optional<std::string> value;
    if (const size_t equals = name.find('='); equals != std::string_view::npos) {
      value = std::string(name.substr(equals + 1));
      name = name.substr(0, equals);
    }
    if (named(flags, name)) {
      if (value) KCliFail("The option '--" + std::string(name) + "' takes no value.");
      options_.push_back({std::string(name), {}});
    } else if (named(withValue, name)) {
      if (!value) {
        if (i + 1 >= words.size()) KCliFail("The option '--" + std::string(name) + "' needs a value.");
        value = words[++i];
      }
      options_.push_back({std::string(name), *value});
    } else {
      KCliFail("Unknown option '--" + std::string(name) + "' for '" + std::string(command) + "'.");
    }
  }
}

bool KCliArguments::Has(std::string_view name) const noexcept {
  return std::any_of(options_.begin(), options_.end(), [&](const Option& o) { return o.name == name; });
}

std::optional<std::string> KCliArguments::Last(std::string_view name) const {
  for (auto o = options_.rbegin(); o != options_.rend(); ++o)
    if (o->name == name) return o->value;
  return std::nullopt;
}

std::vector<std::span<char* const>> KSplitChain(std::span<char* const> words) {
  std::vector<std::span<char* const>> parts;
  for (size_t begin = 0, end; begin <= words.size(); begin = end + 1) {
    end = begin;
    while (end < words.size() && std::string_view(words[end]) != "+") ++end;
    parts.push_back(words.subspan(begin, end - begin));
  }
  return parts;
}
