// SPDX-License-Identifier: MIT
// The Ruby flavour of the macro engine, its factory, and the Ruby language description.
// Threading: the host thread only.
#pragma once

#include "xLib/xMacroWSH.h"

class xScriptInfo;

class MacroRuby : public xMacroWSH {
 public:
  ~MacroRuby() override = default;
};

// Makes an engine and re-reads the current language description from its file, with the Ruby values
// as defaults. Null when there is no memory. The caller ends it through Destroy().
xMacro* CreateMacroEngine();

// The Ruby values of every member but NoCase, which stays.
void SetRubyDefaults(xScriptInfo& target);
