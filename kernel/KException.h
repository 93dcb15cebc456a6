#pragma once

#include <cstdint>

#include "kernel/KExport.h"
#include "kernel/KString.h"

// The system's one exception class. The message is meant for the user: whole sentences
// ending in a full stop. Thrown by value, caught by reference.
class TORVANE_API KException {
public:
  explicit KException(KString message, KString context = {}, int64_t code = 0) noexcept
      : context_(std::move(context)), message_(std::move(message)), code_(code) {}
  KException(const KException&) noexcept = default;
  KException& operator=(const KException&) noexcept = default;
  virtual ~KException();

  const KString& Context() const noexcept { return context_; }
  const KString& Message() const noexcept { return message_; }
  int64_t Code() const noexcept { return code_; }

private:
  KString context_;
  KString message_;
  int64_t code_;
};
