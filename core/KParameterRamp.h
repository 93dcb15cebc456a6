#pragma once

#include <cstdint>

// A moving parameter: a piecewise-linear envelope of normalised values over sample time.
// Point 0 starts the current segment, point 1 ends it, later points are further corners;
// times are relative to the start of the current sub-block.
struct ParameterRamp {
  static constexpr int32_t kMaxPoints = 64;
  // In point 1: "the end of the current host block", replaced once the block length is known.
  static constexpr int32_t kBlockEnd = 2147483647;

  struct Point {
    int32_t time;
    double value;
  };

  ParameterRamp* previous = nullptr;
  ParameterRamp* next = nullptr;
  int32_t parameter = 0;
  Point points[kMaxPoints];
  int8_t pointCount = 0;
  uint8_t fine = 0;  // moves on the plug-in's fine grid (KAudioPluginBase), cut into fine sub-blocks
  uint8_t posted = 0;  // came through the hand-over from another thread (returns to that pool)
  uint8_t modulation = 0;  // moves the parameter's modulation offset (-1..1), not its value
};

// Doubly linked list of ramp records. Never allocates: records move between lists.
class KRampList {
public:
  ParameterRamp* Head() const noexcept { return head_; }
  int32_t Count() const noexcept { return count_; }
  bool IsEmpty() const noexcept { return count_ == 0; }

  void PushBack(ParameterRamp* ramp) noexcept {
    ramp->previous = tail_;
    ramp->next = nullptr;
    (tail_ ? tail_->next : head_) = ramp;
    tail_ = ramp;
    ++count_;
  }
  ParameterRamp* PopFront() noexcept {
    ParameterRamp* ramp = head_;
    if (ramp) Remove(ramp);
    return ramp;
  }
  void Remove(ParameterRamp* ramp) noexcept {
    (ramp->previous ? ramp->previous->next : head_) = ramp->next;
    (ramp->next ? ramp->next->previous : tail_) = ramp->previous;
    ramp->previous = ramp->next = nullptr;
    --count_;
  }
  // Moves every record of `other` to the end of this list, in order.
  void Splice(KRampList& other) noexcept {
    if (other.IsEmpty()) return;
    other.head_->previous = tail_;
    (tail_ ? tail_->next : head_) = other.head_;
    tail_ = other.tail_;
    count_ += other.count_;
    other.head_ = other.tail_ = nullptr;
    other.count_ = 0;
  }

private:
  ParameterRamp* head_ = nullptr;
  ParameterRamp* tail_ = nullptr;
  int32_t count_ = 0;
};
