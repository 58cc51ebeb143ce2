// melodrift: the desktop program. Everything it does is in the library it shares with its
// tests; see app/desktopStartup.h.
#include "app/desktopStartup.h"

int main(int argc, char** argv) { return runDesktopProgram(argc, argv); }
