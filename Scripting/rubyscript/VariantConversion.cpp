// SPDX-License-Identifier: MIT
#include <string.h>

#include "ComObject.h"
#include "VariantConversion.h"
// Last: they rename what the headers above use.
#include <ruby/encoding.h>

#include "RubyCall.h"

// --- To the host ---------------------------------------------------------------------------------

namespace {

// The bridge of an 8-bit host cuts longer texts silently.
constexpr long kMostBytesToByteHost = 512;

constexpr int kMostNesting = 32;  // of arrays

VALUE ToIntegerForVariant(VALUE value) {
  if (FIXNUM_P(value)) return value;
  if (rb_absint_size(value, nullptr) < sizeof(LONG_LONG)) {
    const LONG_LONG integer = NUM2LL(value);
    if (integer == static_cast<LONG>(integer)) return value;
  }
  const double real = rb_big2dbl(value);
  const bool finite = real - real == 0;
  if (!finite || !RTEST(rb_equal(rb_dbl2big(real), value)))
    rb_raise(rb_eRangeError, "integer too big to pass exactly to a COM object: %" PRIsVALUE, value);
  return DBL2NUM(real);
}

void CheckByteHostText(VALUE text) {
  if (RSTRING_LEN(text) > kMostBytesToByteHost)
    rb_raise(rb_eArgError,
             "text of %ld bytes: a function of the editor takes at most %ld; pass it in pieces",
             RSTRING_LEN(text), kMostBytesToByteHost);
  if (memchr(RSTRING_PTR(text), 0, RSTRING_LEN(text)))
    rb_raise(rb_eArgError, "text contains a null byte, which ends it for the editor");
}

VALUE ToTextForVariant(VALUE text, TextForm form) {
  const int encoding = rb_enc_get_index(text);
  const bool binary = encoding == rb_ascii8bit_encindex();
  if (encoding != rb_utf8_encindex() && encoding != rb_usascii_encindex() && !binary)
    text = rb_str_encode(text, rb_enc_from_encoding(rb_utf8_encoding()), 0, Qnil);
  if (form == TextForm::kBytes) {
    CheckByteHostText(text);
  } else {
    const int range = rb_enc_str_coderange(text);
    if (range == ENC_CODERANGE_BROKEN || (binary && range != ENC_CODERANGE_7BIT))
      rb_raise(rb_eEncodingError,
               "text with bytes that are no UTF-8 cannot go to a COM object: %" PRIsVALUE,
               rb_inspect(text));
  }
  return text;
}

VALUE ToValueForVariant(VALUE value, TextForm form, int nesting);

// The bridge of an 8-bit host would make an empty text of an array.
VALUE ToArrayForVariant(VALUE array, TextForm form, int nesting) {
  if (form == TextForm::kBytes)
    rb_raise(rb_eTypeError, "no Array can be passed to the editor; make a text of it, with join");
  if (nesting > kMostNesting)
    rb_raise(rb_eArgError, "array nested more than %d deep, or in itself", kMostNesting);
  const VALUE result = rb_ary_new_capa(RARRAY_LEN(array));
  for (long i = 0; i < RARRAY_LEN(array); ++i)
    rb_ary_push(result, ToValueForVariant(RARRAY_AREF(array, i), form, nesting + 1));
  return result;
}

VALUE ToObjectForVariant(VALUE value, TextForm form, int nesting) {
  if (IsComObject(value)) {
    if (!DispatchOf(value)) rb_raise(rb_eArgError, "the COM object is gone: its engine is closed");
    return value;
  }
  const VALUE date = rb_funcall(ActiveScriptModule(), rb_intern("ole_date"), 1, value);
  if (!NIL_P(date)) return date;
  const VALUE text = rb_check_string_type(value);
  if (!NIL_P(text)) return ToTextForVariant(text, form);
  const VALUE array = rb_check_array_type(value);
  if (!NIL_P(array)) return ToArrayForVariant(array, form, nesting);
  rb_raise(rb_eTypeError, "no %" PRIsVALUE " can be passed to a COM object; convert it first",
           rb_obj_class(value));
}

VALUE ToValueForVariant(VALUE value, TextForm form, int nesting) {
  switch (TYPE(value)) {
    case T_NIL:
    case T_TRUE:
    case T_FALSE:
    case T_FLOAT:
      return value;
    case T_FIXNUM:
    case T_BIGNUM:
      return ToIntegerForVariant(value);
    case T_STRING:
      return ToTextForVariant(value, form);
    case T_SYMBOL:
      return ToTextForVariant(rb_sym2str(value), form);
    case T_ARRAY:
      return ToArrayForVariant(value, form, nesting);
    default:
      return ToObjectForVariant(value, form, nesting);
  }
}

bool FillArray(VALUE array, TextForm form, VARIANT& variant) {
  const long count = RARRAY_LEN(array);
  SAFEARRAY* const safeArray = SafeArrayCreateVector(VT_VARIANT, 0, static_cast<ULONG>(count));
  if (!safeArray) return false;
  VARIANT* const elements = static_cast<VARIANT*>(safeArray->pvData);
  for (long i = 0; i < count; ++i) {
    if (FillVariant(RARRAY_AREF(array, i), form, elements[i])) continue;
    SafeArrayDestroy(safeArray);
    return false;
  }
  variant.vt = VT_ARRAY | VT_VARIANT;
  variant.parray = safeArray;
  return true;
}

}  // namespace

VALUE ToVariantValue(VALUE value, TextForm form) { return ToValueForVariant(value, form, 0); }

bool FillVariant(VALUE passable, TextForm form, VARIANT& variant) {
  switch (TYPE(passable)) {
    case T_NIL:
      return true;
    case T_TRUE:
    case T_FALSE:
      variant.vt = VT_BOOL;
      variant.boolVal = RTEST(passable) ? VARIANT_TRUE : VARIANT_FALSE;
      return true;
    case T_FIXNUM:
    case T_BIGNUM:
      variant.vt = VT_I4;
      variant.lVal = NUM2LONG(passable);
      return true;
    case T_FLOAT:
      variant.vt = VT_R8;
      variant.dblVal = RFLOAT_VALUE(passable);
      return true;
    case T_STRING: {
      const UINT bytes = static_cast<UINT>(RSTRING_LEN(passable));
      const BSTR text = TextToHost(RSTRING_PTR(passable), bytes, form);
      if (!text) return false;
      variant.vt = VT_BSTR;
      variant.bstrVal = text;
      return true;
    }
    case T_ARRAY:
      return FillArray(passable, form, variant);
    case T_STRUCT:
      variant.vt = VT_DATE;
      variant.date = RFLOAT_VALUE(RSTRUCT_GET(passable, 0));
      return true;
    default:
      variant.vt = VT_DISPATCH;
      variant.pdispVal = DispatchOf(passable);
      if (variant.pdispVal) variant.pdispVal->AddRef();
      return true;
  }
}

// --- From the host -------------------------------------------------------------------------------

namespace {

// value / denominator, as Integer where it is whole.
VALUE Fraction(VALUE value, VALUE denominator) {
  const VALUE quotient = rb_rational_new(value, denominator);
  return rb_rational_den(quotient) == INT2FIX(1) ? rb_rational_num(quotient) : quotient;
}

VALUE FromDecimal(const DECIMAL& decimal) {
  const unsigned long words[] = {decimal.Lo32, decimal.Mid32, decimal.Hi32};
  VALUE value = rb_integer_unpack(words, 3, sizeof words[0], 0,
                                  INTEGER_PACK_LSWORD_FIRST | INTEGER_PACK_NATIVE_BYTE_ORDER);
  if (decimal.sign & DECIMAL_NEG) value = rb_funcall(value, rb_intern("-@"), 0);
  return Fraction(value, rb_int_positive_pow(10, decimal.scale));
}

VALUE FromElements(SAFEARRAY* array, UINT dimension, LONG* indexes, VARTYPE type, TextForm form) {
  LONG low = 0;
  LONG high = -1;
  SafeArrayGetLBound(array, dimension, &low);
  SafeArrayGetUBound(array, dimension, &high);
  const VALUE result = rb_ary_new();
  for (LONG i = low; i <= high; ++i) {
    indexes[dimension - 1] = i;
    if (dimension < SafeArrayGetDim(array)) {
      rb_ary_push(result, FromElements(array, dimension + 1, indexes, type, form));
      continue;
    }
    void* element = nullptr;
    if (FAILED(SafeArrayPtrOfIndex(array, indexes, &element))) break;
    VARIANT reference = {};
    reference.vt = static_cast<VARTYPE>(type | VT_BYREF);
    reference.byref = element;
    rb_ary_push(result, FromVariant(reference, form));
  }
  return result;
}

VALUE FromArray(SAFEARRAY* array, VARTYPE type, TextForm form) {
  constexpr UINT kMostDimensions = 16;
  LONG indexes[kMostDimensions] = {};
  const UINT dimensions = array ? SafeArrayGetDim(array) : 0;
  if (dimensions == 0) return rb_ary_new();
  if (dimensions > kMostDimensions)
    rb_raise(rb_eTypeError, "array of %u dimensions from a COM object", dimensions);
  return FromElements(array, 1, indexes, type, form);
}

VALUE FromDate(double days) {
  return rb_funcall(ActiveScriptModule(), rb_intern("time_from_ole"), 1, DBL2NUM(days));
}

VALUE FromBstr(BSTR text, TextForm form) {
  return StringFromHost(text, SysStringLen(text), form, TextOrigin::kResult);
}

VALUE FromDispatch(IDispatch* dispatch, TextForm form) {
  if (!dispatch) return Qnil;
  dispatch->AddRef();
  return NewComObject(dispatch, form, Qnil);
}

// `value` is the field itself or, by reference, what it points to.
VALUE FromField(VARTYPE type, const void* value, TextForm form) {
  switch (type) {
    case VT_I1:
      return INT2FIX(*static_cast<const signed char*>(value));
    case VT_UI1:
      return INT2FIX(*static_cast<const unsigned char*>(value));
    case VT_I2:
      return INT2FIX(*static_cast<const short*>(value));
    case VT_UI2:
      return INT2FIX(*static_cast<const unsigned short*>(value));
    case VT_I4:
    case VT_INT:
      return LONG2NUM(*static_cast<const LONG*>(value));
    case VT_UI4:
    case VT_UINT:
      return ULONG2NUM(*static_cast<const ULONG*>(value));
    case VT_ERROR:
      return *static_cast<const LONG*>(value) == DISP_E_PARAMNOTFOUND
                 ? Qnil
                 : LONG2NUM(*static_cast<const LONG*>(value));
    case VT_I8:
      return LL2NUM(*static_cast<const LONG_LONG*>(value));
    case VT_UI8:
      return ULL2NUM(*static_cast<const unsigned LONG_LONG*>(value));
    case VT_R4:
      return DBL2NUM(static_cast<double>(*static_cast<const float*>(value)));
    case VT_R8:
      return DBL2NUM(*static_cast<const double*>(value));
    case VT_BOOL:
      return *static_cast<const VARIANT_BOOL*>(value) ? Qtrue : Qfalse;
    case VT_DATE:
      return FromDate(*static_cast<const double*>(value));
    case VT_CY:
      return Fraction(LL2NUM(static_cast<const CY*>(value)->int64), INT2FIX(10000));
    case VT_BSTR:
      return FromBstr(*static_cast<const BSTR*>(value), form);
    case VT_UNKNOWN:
      if (!*static_cast<IUnknown* const*>(value)) return Qnil;
      break;
    case VT_DISPATCH:
      return FromDispatch(*static_cast<IDispatch* const*>(value), form);
    default:
      break;
  }
  rb_raise(rb_eTypeError, "value of type %d from a COM object has no Ruby form", type);
}

}  // namespace

VALUE FromVariant(const VARIANT& variant, TextForm form) {
  const VARTYPE type = static_cast<VARTYPE>(variant.vt & ~VT_BYREF);
  const bool reference = (variant.vt & VT_BYREF) != 0;
  if (type == VT_EMPTY || type == VT_NULL) return Qnil;
  if (reference && !variant.byref) rb_raise(rb_eTypeError, "null reference from a COM object");
  if (type == VT_VARIANT) return FromVariant(*variant.pvarVal, form);
  if (type == VT_DECIMAL) return FromDecimal(reference ? *variant.pdecVal : variant.decVal);
  if (type & VT_ARRAY)
    return FromArray(reference ? *variant.pparray : variant.parray,
                     static_cast<VARTYPE>(type & ~VT_ARRAY), form);
  return FromField(type, reference ? variant.byref : &variant.byref, form);
}

VALUE StringFromHost(const wchar_t* text, UINT units, TextForm form, TextOrigin origin) {
  const VALUE string = rb_utf8_str_new(nullptr, static_cast<long>(units) * kMostBytesPerUnit);
  const UINT bytes = TextFromHost(text, units, form, origin, RSTRING_PTR(string));
  rb_str_set_len(string, static_cast<long>(bytes));
  return string;
}
