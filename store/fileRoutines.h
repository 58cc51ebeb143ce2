#pragma once
// The low-level file routines of the song store: each reports its own failure in an error
// box ("Cannot " and the path, "File could not be closed", "File could not be seeked",
// "Bytes were not stored properly", "File could not be deleted") and returns 0, so that the
// calling operation only has to unwind.

#include <cstdint>
#include <cstdio>
#include <string>

FILE* openReportedFile(const std::string& path, const char* mode);   // nullptr after "Cannot <path>"
int closeReportedFile(FILE* f);                                       // 1 closed, 0 reported
int seekReportedFile(FILE* f, int64_t offset);                        // from the start; 1 or 0
int writeReportedBytes(FILE* f, const void* bytes, size_t count);     // 1 all written, 0 reported
int readReportedBytes(FILE* f, void* bytes, size_t count);            // 1 all read, 0 (no message: callers word it)
int deleteReportedFile(const std::string& path);                      // 1 deleted or absent, 0 reported
// Copies the file at from to to, through "<to>.part" renamed over to once complete, so that a
// copy that fails leaves to as it was (and no ".part" behind). 1 copied; 0 after "Cannot "
// and the path, "Bytes were not stored properly", "File could not be closed" or the memory
// message.
int copyReportedFile(const std::string& from, const std::string& to);
