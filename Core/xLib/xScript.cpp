// SPDX-License-Identifier: MIT
#include "xLib/xScript.h"

#include <oleauto.h>

#include "cLib/cMemory.h"
#include "iLib/iComText.h"
#include "iLib/iModule.h"
#include "xLib/xArgument.h"

xScript::xScript(bool fixCRLF, bool fixDelimiter)
    : host(CurrentHost()), fixCRLF(fixCRLF), fixDelimiter(fixDelimiter) {}

xScript::~xScript() { TraceTo(host, "Script object destroyed."); }

void xScript::CheckLayout() {
#if CORE_MICROSOFT_ABI
  static_assert(offsetof(xScript, references) == 4, "fields follow the table");
  static_assert(offsetof(xScript, host) == 8, "fields follow the table");
  static_assert(offsetof(xScript, fixCRLF) == 12, "fields follow the table");
  static_assert(offsetof(xScript, fixDelimiter) == 13, "fields follow the table");
  static_assert(sizeof(xScript) == 16, "the site holds it by value");
#endif
}

HRESULT xScript::QueryInterface(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  if (riid != IID_IUnknown && riid != IID_IDispatch && riid != IID_IErrorInfo) {
    *object = nullptr;
    return E_NOINTERFACE;
  }
  *object = this;
  AddRef();
  return S_OK;
}

ULONG xScript::AddRef() { return static_cast<ULONG>(InterlockedIncrement(&references)); }

ULONG xScript::Release() {
  if (InterlockedDecrement(&references) == 0) return 0;
  // Deliberately read again: engines get the current count.
  return static_cast<ULONG>(references);
}

HRESULT xScript::GetTypeInfoCount(UINT*) {
  TraceTo(host, "GetTypeInfoCount call succeeded.");
  return E_NOTIMPL;
}

HRESULT xScript::GetTypeInfo(UINT, LCID, ITypeInfo**) {
  TraceTo(host, "GetTypeInfo call succeeded.");
  return E_NOTIMPL;
}

HRESULT xScript::GetIDsOfNames(REFIID riid, LPOLESTR* names, UINT count, LCID, DISPID* ids) {
  HostInterface* current = CurrentHost();
  if (riid != IID_NULL || !current) return DISP_E_UNKNOWNINTERFACE;
  TraceTo(host, "GetIDsOfNames call succeeded.");
  if (count == 0) return S_OK;
  if (!names || !ids) return E_POINTER;
  for (UINT i = 0; i < count; ++i) {
    NarrowText name;
    const u32 id = current->FunctionId(NarrowFromWide(names[i], name));
    if (id == kUnknownFunction) {
      const String text = String("Call to unknown macro scripting function:  ") + name;
      if (host) host->ReportMessage(text.Text());
      return E_FAIL;
    }
    ids[i] = static_cast<DISPID>(id);
  }
  return S_OK;
}

// Where an argument is made: a block of the C heap, which deleting the argument gives back.
namespace {
struct Place {
  void* block;
};
}  // namespace
void* __cdecl operator new(size_t, Place place) noexcept { return place.block; }

// A value of any other type as text; the text stays empty when the system cannot convert it.
static xArgument* MakeFromText(Place place, VARIANT& value) {
  VARIANT text = {};
  VariantChangeType(&text, &value, 0, VT_BSTR);
  xArgument* const argument = new (place) xArgument(NarrowFromWide(text.bstrVal));
  VariantClear(&text);
  return argument;
}

static xArgument* MakeArgument(Place place, VARIANT& value) {
  switch (value.vt) {
    case VT_BSTR:
      return new (place) xArgument(NarrowFromWide(value.bstrVal));
    case VT_I1:
      return new (place) xArgument(i32{static_cast<signed char>(value.cVal)});
    case VT_I2:
      return new (place) xArgument(i32{value.iVal});
    case VT_I4:
      return new (place) xArgument(static_cast<i32>(value.lVal));
    case VT_INT:
      return new (place) xArgument(i32{value.intVal});
    case VT_R8:
      return new (place) xArgument(static_cast<u64>(value.ullVal));
    default:
      return MakeFromText(place, value);
  }
}

// Empty values and objects have no form that the host knows: they are skipped and later arguments
// move up.
static bool IsSkipped(const VARIANT& value) {
  return value.vt == VT_EMPTY || value.vt == VT_DISPATCH;
}

static bool IsPlain(const VARIANT& value) {
  switch (value.vt) {
    case VT_BSTR:
    case VT_I1:
    case VT_I2:
    case VT_I4:
    case VT_INT:
    case VT_R8:
      return true;
    default:
      return IsSkipped(value);
  }
}

static bool ArePlain(const DISPPARAMS& params) {
  for (UINT i = 0; params.rgvarg && i < params.cArgs; ++i)
    if (!IsPlain(params.rgvarg[i])) return false;
  return true;
}

// Whether this module created the argument. One from the host may have another destructor and heap.
// Objects begin with the address of their class's virtual table.
static bool IsOwn(const xArgument& argument) {
  return IsInModule(*reinterpret_cast<void* const*>(&argument));
}

// Destroys the argument that an earlier call has left at `index`. Its block is returned, which saves
// a call with three arguments a quarter of its time; null when there is none to be used again.
static void* BlockLeftAt(Array<xArgument>& arguments, i32 index) {
  if (!arguments.At(index)) return nullptr;
  xArgument* const old = arguments.Detach(index);
  if (IsOwn(*old)) {
    old->~xArgument();
    return old;
  }
  delete old;
  return nullptr;
}

// Stores an argument in place of what is there. False: no memory.
static bool Put(VARIANT& value, Array<xArgument>& arguments, i32 index) {
  Place place = {BlockLeftAt(arguments, index)};
  if (!place.block) place.block = AllocateBlock(sizeof(xArgument));
  if (!place.block) return false;
  xArgument* const argument = MakeArgument(place, value);
  if (arguments.SetAt(argument, index) == index) return true;
  delete argument;
  return false;
}

// The arguments in the script's order, and nothing else; COM stores them last first. False: no
// memory, and those that found some are there.
static bool Convert(const DISPPARAMS& params, Array<xArgument>& arguments) {
  // What a list does not own it must not destroy.
  if (!arguments.OwnsElements()) arguments.Clear();
  i32 count = 0;
  bool complete = true;
  for (UINT i = params.rgvarg ? params.cArgs : 0; complete && i-- > 0;) {
    VARIANT& value = params.rgvarg[i];
    if (IsSkipped(value)) continue;
    complete = Put(value, arguments, count);
    if (complete) ++count;
  }
  arguments.Truncate(count);
  return complete;
}

// Hands the arguments over to the host's list. False: no memory.
static bool Move(Array<xArgument>& from, Array<xArgument>& to) {
  for (i32 i = 0; i < from.Count(); ++i) {
    if (to.SetAt(from.At(i), i) < 0) return false;
    from.Detach(i);
  }
  return true;
}

// Null, here and below: no memory.
static HostContext* FillPlain(HostInterface& host, const DISPPARAMS& params) {
  HostContext& context = *host.Context();
  context.ResultTexts().Clear();
  return Convert(params, context.ArgumentList()) ? &context : nullptr;
}

// The value of an object may be the script's own code, whose calls pass through the same record: it
// is converted before the record is touched.
static HostContext* FillFromObjects(HostInterface& host, const DISPPARAMS& params) {
  Array<xArgument> arguments;
  if (!Convert(params, arguments)) return nullptr;
  HostContext& context = *host.Context();
  context.ArgumentList().Clear();
  context.ResultTexts().Clear();
  return Move(arguments, context.ArgumentList()) ? &context : nullptr;
}

// Empties the record and fills its argument list. What it needs is freed before the host is called,
// which may never return.
static HostContext* PrepareCall(HostInterface& host, const DISPPARAMS* params) {
  static constexpr DISPPARAMS kNone = {};
  if (!params) params = &kNone;
  return ArePlain(*params) ? FillPlain(host, *params) : FillFromObjects(host, *params);
}

// The host's result. A text result of another kind leaves `result` as the caller gave it.
static void GetResult(HostContext& context, VARIANT& result) {
  const Array<String>& texts = context.ResultTexts();
  if (texts.Count() == 0) {
    result.vt = VT_I4;
    result.lVal = context.integerResult;
  } else if (context.resultKind == kTextResult) {
    const String* text = texts.At(0);
    result.vt = VT_BSTR;
    result.bstrVal = SysAllocString(WideFromNarrow(text ? text->Text() : nullptr));
  }
}

HRESULT xScript::Invoke(DISPID id, REFIID riid, LCID, WORD, DISPPARAMS* params, VARIANT* result,
                        EXCEPINFO*, UINT*) {
  HostInterface* current = CurrentHost();
  if (riid != IID_NULL || id < 0 || !current) return DISP_E_UNKNOWNINTERFACE;
  SetErrorInfo(0, nullptr);
  HostContext* const context = PrepareCall(*current, params);
  if (!context) return E_OUTOFMEMORY;
  current->SetFixCRLF(fixCRLF);
  current->SetFixDelimiter(fixDelimiter);
  current->CallFunction(static_cast<u32>(id));
  if (result) GetResult(*context, *result);
  return S_OK;
}

HRESULT xScript::SupportsErrorInfo(REFIID) { return S_OK; }

HRESULT xScript::FxFakeError() {
  TraceTo(host, "FxFakeError is faking an error.");
  ICreateErrorInfo* creator = nullptr;
  if (FAILED(CreateErrorInfo(&creator))) return E_FAIL;
  // The setters only read their text; their parameters lack the const.
  creator->SetSource(const_cast<LPOLESTR>(L"COM"));
  creator->SetDescription(
      const_cast<LPOLESTR>(L"This is a fake error generated by the component."));
  IErrorInfo* error = nullptr;
  if (SUCCEEDED(creator->QueryInterface(IID_IErrorInfo, reinterpret_cast<void**>(&error)))) {
    SetErrorInfo(0, error);
    error->Release();
  }
  creator->Release();
  return E_FAIL;
}
