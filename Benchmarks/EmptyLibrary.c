/* SPDX-License-Identifier: MIT */
/* A DLL that does nothing: what the module's loading is compared with. */
__declspec(dllexport) int __stdcall nothing(void);

int __stdcall nothing(void) { return 0; }
