// The little start-up support a freestanding DLL needs in place of a C runtime.
#pragma once

// Runs the global constructors the compiler placed between the .CRT$XCA and .CRT$XCZ markers.
// A DLL's entry point calls it on process attach before anything else.
void RunGlobalConstructors();
