// SPDX-License-Identifier: MIT
// `ActiveScript::ComObject`: an IDispatch as a Ruby object. Its methods and properties are found by
// name when they are called; see prelude/host_objects.rb for what else it answers.
//
// Ownership: each object holds one reference, which is given back on the host's side, after the
// object has been collected or its context has been closed.
// Threading: Ruby side, the main thread; calls from other threads of Ruby raise ThreadError.
// Errors: a call that fails raises ActiveScript::ComError, an unknown name NoMethodError.
#pragma once

#include <windows.h>
// Needs windows.h before it.
#include <oleauto.h>

#include "TextCoding.h"
// Last: it renames what the headers above use.
#include <ruby.h>

// Defines the class, in the module given.
void DefineComObject(VALUE module);

// An object that takes over the caller's reference to `dispatch`. The name shows in messages.
VALUE NewComObject(IDispatch* dispatch, TextForm form, VALUE name);
bool IsComObject(VALUE value);
// Borrowed; null after the object's engine has let go of it.
IDispatch* DispatchOf(VALUE object);

// Host side: gives back the references of objects that have been collected, and makes what
// win32ole has put off.
void ReleaseCollectedObjects();
// Host side: gives back those of all objects that were made for the owner's tasks (see RubyTask);
// a call on one raises from now on.
void ReleaseObjectsOf(const void* owner);
