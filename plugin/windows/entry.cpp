// SPDX-License-Identifier: MIT
// What Windows calls as it loads and unloads the plug-in. There is nothing to set up: no static needs a constructor, so
// the plug-in does without the compiler's start files. Those would also bring a TLS directory, and Windows goes on to
// send notifications of threads to a library that has one.
#define WIN32_LEAN_AND_MEAN
#include <windows.h>

extern "C" BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID /*reserved*/) {
    if (reason == DLL_PROCESS_ATTACH) {
        DisableThreadLibraryCalls(instance);
    }
    return TRUE;
}
