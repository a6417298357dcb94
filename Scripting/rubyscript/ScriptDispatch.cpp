// SPDX-License-Identifier: MIT
#include "ScriptDispatch.h"

#include <wchar.h>

#include <new>

#include "ScriptEngine.h"

ScriptDispatch::ScriptDispatch(ScriptEngine* owner) : engine(owner) { engine->AddRef(); }

ScriptDispatch::~ScriptDispatch() {
  while (Name* const name = names) {
    names = name->next;
    SysFreeString(name->text);
    delete name;
  }
  engine->Release();
}

HRESULT ScriptDispatch::QueryInterface(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  const bool known = riid == IID_IUnknown || riid == IID_IDispatch;
  *object = known ? this : nullptr;
  if (!known) return E_NOINTERFACE;
  AddRef();
  return S_OK;
}

ULONG ScriptDispatch::AddRef() { return static_cast<ULONG>(InterlockedIncrement(&references)); }

ULONG ScriptDispatch::Release() {
  const LONG left = InterlockedDecrement(&references);
  if (left == 0) delete this;
  return static_cast<ULONG>(left);
}

HRESULT ScriptDispatch::GetTypeInfoCount(UINT* count) {
  if (!count) return E_POINTER;
  *count = 0;
  return S_OK;
}

HRESULT ScriptDispatch::GetTypeInfo(UINT, LCID, ITypeInfo** info) {
  if (info) *info = nullptr;
  return DISP_E_BADINDEX;
}

HRESULT ScriptDispatch::GetIDsOfNames(REFIID riid, LPOLESTR* wanted, UINT count, LCID,
                                      DISPID* ids) {
  if (riid != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
  if (!wanted || !ids) return E_POINTER;
  for (UINT i = 0; i < count; ++i) ids[i] = DISPID_UNKNOWN;
  if (count == 0) return S_OK;
  const HRESULT defined = engine->Defines(*wanted);
  if (FAILED(defined)) return defined;
  if (defined == S_FALSE) return DISP_E_UNKNOWNNAME;
  Name** link = &names;
  DISPID id = 1;
  for (; *link && wcscmp((*link)->text, *wanted) != 0; link = &(*link)->next) ++id;
  if (!*link) {
    const BSTR text = SysAllocString(*wanted);
    *link = text ? new (std::nothrow) Name{text, nullptr} : nullptr;
    if (!*link) {
      SysFreeString(text);
      return E_OUTOFMEMORY;
    }
  }
  *ids = id;
  return count == 1 ? S_OK : DISP_E_UNKNOWNNAME;  // arguments have no names for the host
}

HRESULT ScriptDispatch::Invoke(DISPID id, REFIID riid, LCID, WORD flags, DISPPARAMS* parameters,
                               VARIANT* result, EXCEPINFO* exception, UINT*) {
  if (riid != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
  if (!parameters) return E_POINTER;
  if (result) VariantInit(result);
  if (parameters->cNamedArgs > 0) return DISP_E_NONAMEDARGS;
  const Name* name = names;
  for (DISPID i = 1; name && i != id; ++i) name = name->next;
  if (id < 1 || !name || !(flags & (DISPATCH_METHOD | DISPATCH_PROPERTYGET)))
    return DISP_E_MEMBERNOTFOUND;
  return engine->CallFunction(name->text, parameters, result, exception);
}
