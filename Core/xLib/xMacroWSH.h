// SPDX-License-Identifier: MIT
// The macro engine over an Active Scripting (Windows Script Host) engine: finds the language
// description file, runs one macro file through a script site, and can be stopped from inside it.
//
// Next on the reader's path: xScriptExecutor, the site.
#pragma once

#include "iLib/iProfile.h"
#include "xLib/xMacro.h"

class xScriptExecutor;

class xMacroWSH : public xMacro {
 public:
  // The description file is xMacroWSH.qwsh in the module's folder where the user may write there,
  // else in the user's product folder. The choice is made once and cached.
  xMacroWSH();
  // Uses `descriptionFile` as the description file, also for later engines.
  explicit xMacroWSH(const char* descriptionFile);
  xMacroWSH(const xMacroWSH&) = delete;
  xMacroWSH& operator=(const xMacroWSH&) = delete;

  void Stop() override;
  void Initialise() override;
  void Destroy() override;
  i32 Run(const char* file) override;
  bool FillVersion(ScriptInfoRecord* record, const char* hostPath) override;
  SLOTS_FROM(6);
  SLOT(6) ~xMacroWSH() = default;

  Profile& DescriptionFile() { return profile; }

 private:
  static void CheckLayout();

  Profile profile;
  xScriptExecutor* site = nullptr;  // of the run in progress; owned by that run
};
