// The playback state: the devices, the cursor and the range that the song view draws.
#include "playback/playbackState.h"

PlaybackState playbackState;

void resetPlaybackState() { playbackState = PlaybackState{}; }
