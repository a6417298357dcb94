// SPDX-License-Identifier: MIT
#include "RandomValue.h"

#include <algorithm>
#include <cstring>
#include <string>

#include "RawHost.h"

// An object whose value is, in turn, a number, a text, itself, or an error.
namespace {
HRESULT __stdcall QueryInterface(void* object, REFIID, void** result) {
  ++RandomValue::objectReferences;
  return *result = object, S_OK;
}
ULONG __stdcall AddRef(void*) { return ++RandomValue::objectReferences; }
ULONG __stdcall Release(void*) { return --RandomValue::objectReferences; }
HRESULT __stdcall Refuse() { return E_NOTIMPL; }
HRESULT __stdcall Invoke(void* object, DISPID, REFIID, LCID, WORD, DISPPARAMS*, VARIANT* result,
                         EXCEPINFO*, UINT*) {
  static unsigned turn = 0;
  if (RandomValue::onAsked) RandomValue::onAsked();
  switch (++turn % 4) {
    case 0:
      return result->vt = VT_I4, result->lVal = 42, S_OK;
    case 1:
      return result->vt = VT_BSTR, result->bstrVal = SysAllocString(L"value"), S_OK;
    case 2:
      AddRef(object);
      return result->vt = VT_DISPATCH, result->pdispVal = static_cast<IDispatch*>(object), S_OK;
    default:
      return DISP_E_MEMBERNOTFOUND;
  }
}
void* table[] = {reinterpret_cast<void*>(QueryInterface), reinterpret_cast<void*>(AddRef),
                 reinterpret_cast<void*>(Release),        reinterpret_cast<void*>(Refuse),
                 reinterpret_cast<void*>(Refuse),         reinterpret_cast<void*>(Refuse),
                 reinterpret_cast<void*>(Invoke)};
void** object = table;
}  // namespace

BSTR RandomValue::Text() {
  if (Below(8) == 0) return nullptr;
  std::wstring text(Below(16) ? Below(20) : Below(1500), 0);
  for (wchar_t& unit : text) unit = static_cast<wchar_t>(Below(4) ? ' ' + Below(95) : Below(65536));
  return SysAllocStringLen(text.data(), static_cast<UINT>(text.size()));
}

VARTYPE RandomValue::Type() {
  const unsigned flags[] = {0, 0, 0, 0, VT_ARRAY, VT_VECTOR, VT_RESERVED, VT_TYPEMASK & ~0xFFFu};
  const unsigned base = Below(16) ? Below(VT_CLSID + 2) : Below(0x1000);
  const VARTYPE type = static_cast<VARTYPE>(base | flags[Below(8)]);
  // Users' records come with a description of theirs that no engine makes up.
  return (type & VT_TYPEMASK) == VT_RECORD ? VT_NULL : type;
}

void RandomValue::Fill(VARTYPE type, void* place) {
  unsigned bits[4];
  for (unsigned& word : bits) word = Below(2) ? random() : Below(100);
  if (type == VT_DECIMAL) bits[0] = Below(29) << 16 | Below(2) << 31;  // scale and sign
  std::memcpy(place, bits, type == VT_DECIMAL || type == VT_VARIANT ? 16 : 8);
  if (type & VT_ARRAY) {
    SAFEARRAY* const array =
        Below(4) ? SafeArrayCreateVector(type & VT_TYPEMASK, 0, Below(5)) : nullptr;
    std::memcpy(place, &array, sizeof array);
  } else if (type == VT_BSTR) {
    const BSTR text = Text();
    std::memcpy(place, &text, sizeof text);
  } else if (type == VT_DISPATCH || type == VT_UNKNOWN) {
    void* const pointer = Below(4) ? &object : nullptr;
    if (pointer) AddRef(pointer);
    std::memcpy(place, &pointer, sizeof pointer);
  }
}

RandomValue::RandomValue(std::mt19937& numbers) : random(numbers) {
  VARTYPE type = Type();
  if (Below(3)) {
    if (type == VT_VARIANT || type == (VT_VECTOR | VT_VARIANT))
      type = VT_NULL;  // by reference only
    Fill(type, type == VT_DECIMAL ? static_cast<void*>(&value) : &value.llVal);
    value.vt = type;
    return;
  }
  value.vt = static_cast<VARTYPE>(type | VT_BYREF);
  if (Below(16) == 0) return;  // to nowhere
  value.byref =
      type == VT_DECIMAL || type == VT_VARIANT ? &target : static_cast<void*>(&target.llVal);
  if (type != VT_VARIANT) {
    target.vt = static_cast<VARTYPE>(type == VT_DECIMAL ? VT_DECIMAL : type);
    Fill(type, value.byref);
    return;
  }
  const VARTYPE simple[] = {VT_EMPTY,    VT_I4,   VT_R8,           VT_BSTR,
                            VT_DISPATCH, VT_BOOL, VT_BYREF | VT_I4};
  target.vt = simple[Below(7)];
  Fill(target.vt, &target.llVal);
  if (target.vt & VT_BYREF) target.plVal = &inner.lVal;
}

RandomValue::~RandomValue() {
  const auto free = [](VARIANT& variant, VARTYPE type) {
    if (type & VT_ARRAY) {
      if (variant.parray) SafeArrayDestroy(variant.parray);
    } else if (type == VT_BSTR) {
      SysFreeString(variant.bstrVal);
    } else if ((type == VT_DISPATCH || type == VT_UNKNOWN) && variant.punkVal) {
      Release(variant.punkVal);
    }
  };
  if (!(value.vt & VT_BYREF))
    free(value, value.vt);
  else if (value.byref)
    free(target, value.vt == (VT_BYREF | VT_VARIANT) ? target.vt
                                                     : static_cast<VARTYPE>(value.vt & ~VT_BYREF));
}

bool RandomValue::Is(void* argument) const {
  const std::string text = At<char*>(argument, 24 + 8);
  const auto is = [argument](int kind, int integer, double real) {
    return At<int>(argument, 8) == kind && At<int>(argument, 12) == integer &&
           std::memcmp(&At<double>(argument, 16), &real, sizeof real) == 0;
  };
  const auto isInteger = [&](int number) {
    return is(2, number, number) && text == std::to_string(number);
  };
  std::string narrow;
  switch (value.vt) {
    case VT_BSTR:
      for (const wchar_t* unit = value.bstrVal; unit && *unit & 0xFF && narrow.size() < 512; ++unit)
        narrow += static_cast<char>(*unit);
      return is(1, 0, 0) && text == narrow;
    case VT_I1:
      return isInteger(static_cast<signed char>(value.cVal));
    case VT_I2:
      return isInteger(value.iVal);
    case VT_I4:
    case VT_INT:
      return isInteger(value.lVal);
    case VT_R8:
      // By its bits: the x87 makes a signalling NaN a quiet one.
      return At<int>(argument, 8) == 3 && At<uint64_t>(argument, 16) == value.ullVal;
    default:
      return is(1, 0, 0) && text.size() <= 512;
  }
}
