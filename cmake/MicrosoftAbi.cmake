# SPDX-License-Identifier: MIT
# Targets whose classes the host editor shares: the Microsoft C++ ABI, no exceptions, no RTTI, no
# C++ standard library.

# Warnings are errors in every target.
if(MSVC)
  # C4611: setjmp beside C++ objects, which the stop mechanism is about. C4458: a constructor's
  # parameter named as its member.
  set(STRICT_WARNINGS /W4 /WX /wd4611 /wd4458 /D_CRT_SECURE_NO_WARNINGS)
else()
  set(STRICT_WARNINGS -Wall -Wextra -Werror -Wshadow -Wconversion -Wno-sign-conversion
      -Woverloaded-virtual -Wsuggest-override -Wno-invalid-offsetof)
endif()

# The options that make the cross compiler speak the Microsoft ABI; Visual Studio's compiler has it.
if(MSVC)
  set(MICROSOFT_ABI_OPTIONS /GR- /EHs-c- /Zc:threadSafeInit-)
else()
  set(MICROSOFT_ABI_OPTIONS
      --target=i686-pc-windows-msvc -fms-extensions -fms-compatibility -fmsc-version=0
      -fgnuc-version=4.9 -D_X86_=1 -D__i386=1 -D__i386__=1
      "SHELL:-isystem /usr/share/mingw-w64/include"
      -D__USE_MINGW_ANSI_STDIO=0 # formatting by msvcrt.dll, not by 20 KiB of code of our own
      -Wno-microsoft-exception-spec # operator new is declared noexcept, which the compiler minds
      -fcheck-new # which it does not go by either: a failed one must not be constructed
      -fno-exceptions -fno-rtti -fno-threadsafe-statics -ffunction-sections -fdata-sections)
endif()

# add_microsoft_abi_library(NAME SOURCE...): an object library for the module's side of the boundary.
function(add_microsoft_abi_library name)
  add_library(${name} OBJECT ${ARGN})
  target_compile_options(${name} PRIVATE ${STRICT_WARNINGS} ${MICROSOFT_ABI_OPTIONS})
  target_compile_definitions(${name} PRIVATE WIN32_LEAN_AND_MEAN NOMINMAX)
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR}/Core)
endfunction()
