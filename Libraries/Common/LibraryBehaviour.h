// Lets a run choose how the bundled libraries behave, so that the driver's handling of every
// library answer can be exercised end to end. The choice is the environment variable
// CHARTBAKE_LIBRARY_BEHAVIOUR, a comma-separated list of words:
//   announce            each library prints "<name> loaded" when its entry point runs
//   unwrap-fail         GenerateSecondaryUVSet writes an error text and returns false
//   unwrap-warn         GenerateSecondaryUVSet writes a warning text, does its work and returns true
//   unwrap-fill         like unwrap-warn, but fills the whole error buffer without a terminating zero
//   unwrap-report-fp    like unwrap-warn, but the text tells the caller's floating-point state:
//                       "rounding toward zero|to nearest|..., denormals kept|flushed, control <hex>\n"
//   unwrap-report-inputs  like unwrap-warn, but the text tells the parameters, counts and optional
//                       arrays it was called with (Libraries/Unwrap/BehaviourReports.h)
//   unwrap-report-stats like unwrap-warn, but the text tells how the chart layout went: "segmented
//                       <n> charts, <n> splits, <n> charts, angle distortion <x>, area distortion <x>\n"
//   unwrap-grid         GenerateSecondaryUVSet lays out every triangle as a chart of its own, in a
//                       grid of equal cells (the layout of Libraries/Unwrap/ChartLayout.h)
//   fail:<export>       the named test export returns false
//   crash:<export>      the named test export writes through a null pointer
// Unset or empty: everything does its real work.
#pragma once

#define LIBRARY_BEHAVIOUR_VARIABLE "CHARTBAKE_LIBRARY_BEHAVIOUR"

// True when `word` is one of the list's items (exact, case-sensitive).
bool BehaviourRequested(const char* word);

// True when "<prefix><exportName>" is one of the list's items.
bool BehaviourRequestedFor(const char* prefix, const char* exportName);

// Wraps a test export's genuine result in the requested behaviour: crash:<export> crashes,
// fail:<export> answers false, anything else passes `result` through.
bool TestExportResult(const char* exportName, bool result);

// Announces the library's load when "announce" is requested.
void AnnounceLoad(const char* libraryName);
