// SPDX-License-Identifier: MIT
// Values between Ruby and COM:
//
//   Integer            VT_I4; beyond 32 bits VT_R8 where that is exact, else RangeError
//   Float              VT_R8
//   String, Symbol     VT_BSTR (see TextCoding.h)
//   true, false        VT_BOOL
//   nil                VT_EMPTY
//   Time, Date         VT_DATE, the time as its own zone shows it; back as local Time
//   Array              VT_ARRAY|VT_VARIANT
//   ComObject          VT_DISPATCH
//
// Back also: every integer and real type, VT_CY and VT_DECIMAL (Rational, or Integer when whole),
// VT_NULL and a missing argument (nil), VT_ERROR (Integer), arrays of any type and rank, and all of
// them by reference. Nothing goes to the host by reference.
//
// Threading: Ruby side, the main thread.
#pragma once

#include <windows.h>
// Needs windows.h before it.
#include <oleauto.h>

#include "TextCoding.h"
// Last: it renames what the headers above use.
#include <ruby.h>

// What FillVariant takes: the value itself or a simpler one. Raises TypeError, RangeError,
// ArgumentError or EncodingError for what the host cannot get.
VALUE ToVariantValue(VALUE value, TextForm form);

// Sets an initialised variant to a passable value and never raises. False: no memory; the variant
// is as before. The caller clears it.
bool FillVariant(VALUE passable, TextForm form, VARIANT& variant);

// A Ruby value of a variant, which stays the caller's. Raises TypeError for a type without one.
VALUE FromVariant(const VARIANT& variant, TextForm form);

// A Ruby string of a text of the host.
VALUE StringFromHost(const wchar_t* text, UINT units, TextForm form, TextOrigin origin);
