# SPDX-License-Identifier: MIT
# The Core library's sources by layer, listed once: the module links them in the Microsoft ABI,
# and the tests also build the portable base in other ABIs.
set(CORE ${CMAKE_CURRENT_LIST_DIR})

# Pure text and container code; includes no Windows header.
set(CLIB_SOURCES
    ${CORE}/cLib/StringDZ.cpp
    ${CORE}/cLib/StringTokenizer.cpp
    ${CORE}/cLib/cHashTable.cpp
    ${CORE}/cLib/cHost.cpp
    ${CORE}/cLib/cMemory.cpp
    ${CORE}/cLib/cReport.cpp
    ${CORE}/cLib/cStop.cpp
    ${CORE}/cLib/cString.cpp)

# What asks the operating system.
set(ILIB_SOURCES
    ${CORE}/iLib/iClipboard.cpp
    ${CORE}/iLib/iCodePage.cpp
    ${CORE}/iLib/iComText.cpp
    ${CORE}/iLib/iFile.cpp
    ${CORE}/iLib/iGeneral.cpp
    ${CORE}/iLib/iModule.cpp
    ${CORE}/iLib/iProfile.cpp
    ${CORE}/iLib/iProfileSection.cpp
    ${CORE}/iLib/iString.cpp)

# What only the compiler of the Microsoft ABI can build.
set(ILIB_MICROSOFT_ABI_SOURCES
    ${CORE}/iLib/iGuard.cpp
    ${CORE}/iLib/iRuntime.cpp)

# The macro engine, and what the library knows of the application around it.
set(XLIB_SOURCES
    ${CORE}/xLib/xApp.cpp
    ${CORE}/xLib/xArgument.cpp
    ${CORE}/xLib/xMacroWSH.cpp
    ${CORE}/xLib/xScript.cpp
    ${CORE}/xLib/xScriptExecutor.cpp
    ${CORE}/xLib/xScriptInfo.cpp)
