#include "surface/Persistence.h"

#include <cstdint>
#include <vector>

namespace tarnwick {
namespace {

constexpr std::uint32_t kStreamVersion = 1;
// In the storage of a control.
constexpr wchar_t kStreamName[] = L"Contents";

// What a property becomes whose kept value is `number`: the default, if it cannot hold that.
std::int32_t HeldBy(const PersistedProperty& property, std::int32_t number) {
  return property.type == VT_I2 && number != static_cast<SHORT>(number) ? 0 : number;
}

}  // namespace

STDMETHODIMP Persistence::GetClassID(CLSID* classId) {
  if (!classId) return E_POINTER;
  *classId = hooks_.ClassId();
  return S_OK;
}

// --- IPersistStreamInit ---

STDMETHODIMP Persistence::InitNew() {
  return Entered([&] {
    for (const PersistedProperty& property : hooks_.Properties()) hooks_.SetProperty(property.id, 0);
    dirty_ = false;
    return S_OK;
  });
}

// A version, then 32 bits for each property, little-endian.
STDMETHODIMP Persistence::Load(IStream* stream) {
  if (!stream) return E_POINTER;
  const auto read = [&](auto& value) {
    ULONG count = 0;
    const HRESULT result = stream->Read(&value, sizeof value, &count);
    return FAILED(result) ? result : count == sizeof value ? S_OK : STG_E_READFAULT;
  };
  return Entered([&]() -> HRESULT {
    std::uint32_t version = 0;
    HRESULT result = read(version);
    if (SUCCEEDED(result) && version != kStreamVersion) result = STG_E_OLDFORMAT;
    std::vector<std::int32_t> values(hooks_.Properties().size());
    for (std::int32_t& value : values)
      if (SUCCEEDED(result)) result = read(value);
    if (FAILED(result)) return result;
    for (std::size_t i = 0; i < values.size(); ++i) {
      const PersistedProperty& property = hooks_.Properties()[i];
      hooks_.SetProperty(property.id, HeldBy(property, values[i]));
    }
    dirty_ = false;
    return S_OK;
  });
}

STDMETHODIMP Persistence::Save(IStream* stream, BOOL clearDirty) {
  if (!stream) return E_POINTER;
  return Entered([&] {
    std::vector<std::uint32_t> values = {kStreamVersion};
    for (const PersistedProperty& property : hooks_.Properties())
      values.push_back(static_cast<std::uint32_t>(hooks_.GetProperty(property.id)));
    const HRESULT result =
        stream->Write(values.data(), static_cast<ULONG>(values.size() * sizeof(std::uint32_t)), nullptr);
    if (SUCCEEDED(result) && clearDirty) dirty_ = false;
    return result;
  });
}

STDMETHODIMP Persistence::GetSizeMax(ULARGE_INTEGER* size) {
  if (!size) return E_POINTER;
  size->QuadPart = (1 + hooks_.Properties().size()) * sizeof(std::uint32_t);
  return S_OK;
}

// --- IPersistPropertyBag ---

STDMETHODIMP Persistence::Load(IPropertyBag* bag, IErrorLog* log) {
  if (!bag) return E_POINTER;
  return Entered([&] {
    for (const PersistedProperty& property : hooks_.Properties()) {
      Variant value;
      // Bags read the value as the type that they are asked for.
      V_VT(&value.Get()) = property.type;
      // A value that is no number does not keep the form from loading.
      const std::int32_t number = ResultAsItStood(0, [&](std::int32_t& kept) {
        if (SUCCEEDED(bag->Read(property.name, &value.Get(), log))) kept = NumberFromVariant(value.Get());
      });
      hooks_.SetProperty(property.id, HeldBy(property, number));
    }
    dirty_ = false;
    return S_OK;
  });
}

STDMETHODIMP Persistence::Save(IPropertyBag* bag, BOOL clearDirty, BOOL all) {
  if (!bag) return E_POINTER;
  return Entered([&] {
    for (const PersistedProperty& property : hooks_.Properties()) {
      const std::int32_t number = hooks_.GetProperty(property.id);
      // 0 is what a bag without the value means.
      if (number == 0 && !all) continue;
      Variant value(VariantFromNumber(number));
      if (property.type == VT_I2) {
        V_VT(&value.Get()) = VT_I2;
        V_I2(&value.Get()) = static_cast<SHORT>(number);
      }
      const HRESULT result = bag->Write(property.name, &value.Get());
      if (FAILED(result)) return result;
    }
    if (clearDirty) dirty_ = false;
    return S_OK;
  });
}

// --- IPersistStorage ---

STDMETHODIMP Persistence::InitNew(IStorage* storage) {
  return storage ? InitNew() : E_POINTER;
}

STDMETHODIMP Persistence::Load(IStorage* storage) {
  if (!storage) return E_POINTER;
  return Entered([&] {
    ComPtr<IStream> stream;
    const HRESULT opened =
        storage->OpenStream(kStreamName, nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, 0, stream.Receive());
    return FAILED(opened) ? opened : Load(stream.Get());
  });
}

STDMETHODIMP Persistence::Save(IStorage* storage, BOOL sameAsLoad) {
  if (!storage) return E_POINTER;
  return Entered([&] {
    ComPtr<IStream> stream;
    const HRESULT made = storage->CreateStream(kStreamName, STGM_CREATE | STGM_WRITE | STGM_SHARE_EXCLUSIVE,
                                               0, 0, stream.Receive());
    return FAILED(made) ? made : Save(stream.Get(), sameAsLoad);
  });
}

}  // namespace tarnwick
