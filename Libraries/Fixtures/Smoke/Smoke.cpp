#include "WinImports.h"
#include "DllRuntime.h"
static int s_value = 41;
extern "C" __declspec(dllexport) int Smoke_Value() { int* p = new int(s_value + 1); int v = *p; delete p; return v + (int)sqrt(0.0); }
extern "C" BOOL DllMain(HMODULE, DWORD reason, void*) { if (reason == 1) RunGlobalConstructors(); return 1; }
