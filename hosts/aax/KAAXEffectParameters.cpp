#include "hosts/aax/KAAXEffectParameters.h"

#include <algorithm>
#include <charconv>
#include <cstring>
#include <string_view>

namespace KAAX {

Result KEffectParameters::Initialize(IController* controller, IAutomationDelegate* automation) {
  controller_ = controller;
  automation_ = automation;
  return EffectInit();
}

std::string KEffectParameters::ValuesText() const {
  std::string text;
  for (int32_t i = 0; i < parameters_.Count(); ++i) {
    char number[32];
    const auto end = std::to_chars(number, number + sizeof number, parameters_.At(i).Normalized()).ptr;
    text.append(parameters_.At(i).Id()).append("=").append(number, end).append("\n");
  }
  return text;
}

Result KEffectParameters::FillChunk(const std::string& text, PluginChunk* chunk) noexcept {
  if (!chunk) return kErrorNullObject;
  if (chunk->fSize < static_cast<int32_t>(text.size())) return kErrorIncorrectChunkSize;
  chunk->fSize = static_cast<int32_t>(text.size());
  std::memcpy(chunk->fData, text.data(), text.size());
  return kSuccess;
}

void KEffectParameters::CopyText(const KString& text, char* to, int32_t capacity) {
  if (!to || capacity <= 0) return;
  const std::string utf8 = text.ToUtf8();
  size_t length = std::min(utf8.size(), static_cast<size_t>(capacity - 1));
  while (length > 0 && length < utf8.size() && (static_cast<unsigned char>(utf8[length]) & 0xC0) == 0x80) --length;
  std::memcpy(to, utf8.data(), length);
  to[length] = 0;
}

Result KEffectParameters::GetChunkSize(ChunkId, uint32_t* size) const {
  if (!size) return kErrorNullObject;
  *size = static_cast<uint32_t>(ValuesText().size());
  return kSuccess;
}

Result KEffectParameters::GetChunk(ChunkId, PluginChunk* chunk) const { return FillChunk(ValuesText(), chunk); }

Result KEffectParameters::SetChunk(ChunkId, const PluginChunk* chunk) {
  if (!chunk || chunk->fSize < 0) return kErrorNullObject;
  const std::string_view text(chunk->fData, static_cast<size_t>(chunk->fSize));
  for (size_t at = 0; at < text.size();) {
    const size_t end = std::min(text.find('\n', at), text.size());
    const std::string_view line = text.substr(at, end - at);
    const size_t equals = line.find('=');
    double value = 0.0;
    if (equals != std::string_view::npos &&
        std::from_chars(line.data() + equals + 1, line.data() + line.size(), value).ec == std::errc())
      UpdateParameterNormalizedValue(std::string(line.substr(0, equals)).c_str(), value);
    at = end + 1;
  }
  return kSuccess;
}

Result KEffectParameters::UpdateParameterNormalizedValue(ParamId id, double normalized) {
  KParameter* parameter = id ? parameters_.Find(id) : nullptr;
  if (!parameter) return kErrorInvalidParameterId;
  parameter->SetNormalized(normalized);
  return kSuccess;
}

Result KEffectParameters::GetParameterStringFromValue(ParamId id, double normalized, char* text, int32_t capacity) const {
  const KParameter* parameter = id ? parameters_.Find(id) : nullptr;
  if (!parameter) return kErrorInvalidParameterId;
  CopyText(parameter->Text(normalized), text, capacity);
  return kSuccess;
}

Result KEffectParameters::GetParameterNormalizedValue(ParamId id, double* normalized) const {
  const KParameter* parameter = id ? parameters_.Find(id) : nullptr;
  if (!parameter) return kErrorInvalidParameterId;
  if (!normalized) return kErrorNullObject;
  *normalized = parameter->Normalized();
  return kSuccess;
}

Result KEffectParameters::SetParameterNormalizedValue(ParamId id, double normalized) {
  if (!id || !parameters_.Find(id)) return kErrorInvalidParameterId;
  if (automation_) automation_->PostSetValueRequest(id, std::clamp(normalized, 0.0, 1.0));
  return UpdateParameterNormalizedValue(id, normalized);
}

Result KEffectParameters::SetParameterNormalizedRelative(ParamId id, double delta) {
  double present = 0.0;
  const Result result = GetParameterNormalizedValue(id, &present);
  return result == kSuccess ? SetParameterNormalizedValue(id, present + delta) : result;
}

Result KEffectParameters::GetParameterNameOfLength(ParamId id, char* name, int32_t length) const {
  const KParameter* parameter = id ? parameters_.Find(id) : nullptr;
  if (!parameter) return kErrorInvalidParameterId;
  CopyText(parameter->Name(), name, length + 1);
  return kSuccess;
}

Result KEffectParameters::GetParameterName(ParamId id, char* name, int32_t capacity) const {
  const KParameter* parameter = id ? parameters_.Find(id) : nullptr;
  if (!parameter) return kErrorInvalidParameterId;
  CopyText(parameter->Name(), name, capacity);
  return kSuccess;
}

}  // namespace KAAX
