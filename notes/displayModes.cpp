// The display modes, held here until the main frame takes them over.
#include "notes/displayModes.h"

DisplayModes displayModes;

void resetDisplayModes() { displayModes = DisplayModes{}; }
