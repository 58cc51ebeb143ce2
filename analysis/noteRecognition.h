#pragma once
// Note recognition's driver: the pass that decides the pitch track of a run of FT blocks. The
// opening worker and the recorder call it, and buildNotes (noteBuilding.h) after it, after
// every chunk's frequency tables; whole-song analysis (wholeSongAnalysis.h) calls both once over
// the song. This unit keeps the extent of the pass in progress and runs the steps in their
// order (mainsHum, pitchDecision, pitchTrackCleaning, pitchFlattening, syllables); the blocks
// they share are recognitionBlocks.h's.

#include <cstdint>

#include "analysis/recognitionBlocks.h"

// Runs the recognition passes on the blocks from the block of fromSample (never before the
// window's first block) to the song's end; toSample bounds the part of the track that is
// final. Monophonic recognition only.
void recognisePitchTrack(uint32_t fromSample, uint32_t toSample);

extern RecognitionPass recognitionPass;

// Forgets the pass, the hum table, the syllables and the song's instrument list (a song is
// closing or a new analysis starts). The note list itself is the note list's.
void resetNoteRecognition();
