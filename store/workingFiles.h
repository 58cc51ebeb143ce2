#pragma once
// The song's working files in the shared folder: their names, their removal at start-up and
// when the song closes, and the emptying of the song's stores.

// Working files removed by deleteWorkingFiles, in this order.
extern const char* const WORKING_FILE_NAMES[11];

// Deletes each working file that exists; 1 when all are gone, 0 when one could not be
// deleted (reported by "File could not be deleted").
int deleteWorkingFiles();
// Empties the FT store: no blocks, an empty window with its arrays freed, and CS.ft/CS.fi
// (CS.ft+/CS.fi+) deleted unless they are open. 1 when nothing failed to be deleted.
int closeFTStore();
// Empties the song's stores: waits for the undo snapshot writer, deletes CS.fw holding
// CSAccessWaveFileMutex, empties the FT store and the Hires buffers, resets the song record
// and its time axis, clears the undo ring and deletes the remaining working files. 1 when
// everything was removed. With keepFiles the memory is emptied and every file is left where
// it is (for inspection after a run). Closing the song (shell/closeSong.h) also empties its notes.
int closeSongStores(bool keepFiles = false);
