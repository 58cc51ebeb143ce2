#pragma once
// Closing the song: its working files, stores, notes, recognition state and selection go,
// so that the next song starts empty. The song's window closing, shut-down, and the
// command-line tool call it.

// Empties the song's stores (store/workingFiles.h: closeSongStores), its note list, the
// recognition state (the next song settles its own instruments and voice) and the selection.
// 1 when every working file was removed. With keepFiles the working files stay in the shared
// folder (melodrift-cli --keep-working-files); the memory is emptied all the same.
int closeSong(bool keepFiles = false);
