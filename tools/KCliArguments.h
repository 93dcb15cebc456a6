#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

// The words after a command: positional arguments and options, each option as "--name VALUE",
// "--name=VALUE" or a bare "--flag" ("-t" and "-q" stand for "--type" and "--quiet"); "-" is
// positional (standard input or output). Options keep their order, so a later --set overrides an
// earlier one and --preset can be applied where it stands among them.
class KCliArguments {
public:
  struct Option {
    std::string name;  // without the dashes
    std::string value;
  };

  // Parses `words`; an option not named in `withValue` or `flags` is an error naming the
  // command ("Unknown option '--x' for 'render'.").
  KCliArguments(std::span<char* const> words, std::string_view command, std::initializer_list<std::string_view> withValue,
                std::initializer_list<std::string_view> flags);

  const std::vector<std::string>& Positional() const noexcept { return positional_; }
  const std::vector<Option>& Options() const noexcept { return options_; }
  bool Has(std::string_view name) const noexcept;
  // The last value given for the option, if any.
  std::optional<std::string> Last(std::string_view name) const;

private:
  std::vector<std::string> positional_;
  std::vector<Option> options_;
};

// The words of a chain, "A [options] + B [options] ...", cut at each "+".
std::vector<std::span<char* const>> KSplitChain(std::span<char* const> words);

// Throws the KException that main reports as "torvane: <message>".
[[noreturn]] void KCliFail(const std::string& message);
