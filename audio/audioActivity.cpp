// Whether a recording or an opening is under way.
#include "audio/audioActivity.h"

AudioActivity audioActivity;
