#pragma once

// A fatal report is never printed by the runtime: its text stays in memory
// when exit() runs. In a death test's child, this registers an exit handler
// that writes that text to stderr, so the parent can match it.
namespace vitest {
void printFatalReportAtExit();
}
