// SPDX-License-Identifier: MIT
#include "xLib/xMacroWSH.h"

#include "cLib/cReport.h"
#include "cLib/cStop.h"
#include "iLib/iGeneral.h"
#include "xLib/xScriptExecutor.h"
#include "xLib/xScriptInfo.h"
#include "xLib/xTexts.h"

static constexpr u8 kSiteFlag = 0;  // handed to the host with every script site

static String descriptionPath;  // empty until first needed
static String hostDataPath;     // from the host's `version` call; nothing here reads it

// Empty, and tried again for the next engine, when no folder can be named.
static String DescriptionPath() {
  if (descriptionPath.IsEmpty()) {
    String folder = ModuleFolder();
    if (!MayReadAndWrite(folder.Text())) folder = ProductFolder();
    if (folder.IsEmpty()) return folder;
    descriptionPath = folder + kDescriptionFileName;
  }
  return descriptionPath;
}

static const char* KeepDescriptionPath(const char* path) {
  descriptionPath.Assign(path);
  return descriptionPath.Text();
}

xMacroWSH::xMacroWSH() : profile(DescriptionPath().Text()) {}

xMacroWSH::xMacroWSH(const char* descriptionFile) : profile(KeepDescriptionPath(descriptionFile)) {}

void xMacroWSH::CheckLayout() {
#if CORE_MICROSOFT_ABI
  static_assert(offsetof(xMacroWSH, profile) == 4, "fields follow the table");
  static_assert(offsetof(xMacroWSH, site) == 28, "fields follow the table");
  static_assert(sizeof(xMacroWSH) == 32, "fields follow the table");
#endif
}

void xMacroWSH::Initialise() { TraceTo(CurrentHost(), "Initialising macro interface"); }

void xMacroWSH::Destroy() {
  TraceTo(CurrentHost(), "Destroying macro interface");
  delete this;
}

i32 xMacroWSH::Run(const char* file) {
  if (!file || !CurrentHost()) return -1;
  const xScriptInfo& info = CurrentScriptInfo();
  // On the heap, although it lives for this call only: a stop abandons it together with its engine,
  // which must not be left with a pointer into a frame that is gone.
  xScriptExecutor* const running =
      new xScriptExecutor(info.GetLanguage(), info.IsFixCRLF(), info.IsFixDelimiter(), kSiteFlag);
  if (!running) {
    REPORT_ASSERT("cScript", "No memory for the script site");
    return -1;
  }
  site = running;
  i32 result = -1;
  if (running->IsReady()) result = running->Execute(file) ? 1 : 0;
  site = nullptr;
  delete running;
  return result;
}

void xMacroWSH::Stop() {
  // On another thread the run goes on, so nothing of it is touched.
  if (!IsOtherThreadArmed()) {
    if (site) site->Interrupt();
    // Abandoned, not released: the frames that use it are about to be skipped.
    site = nullptr;
  }
  StopMacro();
}

bool xMacroWSH::FillVersion(ScriptInfoRecord* record, const char* hostPath) {
  if (MayReadAndWrite(hostPath)) {
    // Deliberate: a host folder that may be written is replaced by the user's own.
    hostDataPath = ProgramsFolder();
  } else {
    hostDataPath.Assign(hostPath);
    hostDataPath.Trim();
    hostDataPath.ReplaceAll("/", "\\");
    if (!hostDataPath.IsEmpty()) EndWithBackslash(hostDataPath);
    if (!EnsureFolder(hostDataPath.Text())) hostDataPath.Assign("");
  }
  return CurrentScriptInfo().CopyToRecord(record);
}
