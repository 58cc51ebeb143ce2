// The song store's file routines, each reporting its own failure in an error box.
#include "store/fileRoutines.h"

#include "platform/files.h"
#include "platform/ui.h"

FILE* openReportedFile(const std::string& path, const char* mode) {
    FILE* f = fileOpen(path, mode);
    if (!f) showMessage(MESSAGE_ERROR, "Cannot " + path);
    return f;
}

int closeReportedFile(FILE* f) {
    if (fileClose(f) != 0) {
        showMessage(MESSAGE_ERROR, "File could not be closed");
        return 0;
    }
    return 1;
}

int seekReportedFile(FILE* f, int64_t offset) {
    if (fileSeek(f, offset, SEEK_SET) != 0) {
        showMessage(MESSAGE_ERROR, "File could not be seeked");
        return 0;
    }
    return 1;
}

int writeReportedBytes(FILE* f, const void* bytes, size_t count) {
    if (fileWrite(bytes, count, f) != count) {
        showMessage(MESSAGE_ERROR, "Bytes were not stored properly");
        return 0;
    }
    return 1;
}

int readReportedBytes(FILE* f, void* bytes, size_t count) { return fileRead(bytes, count, f) == count ? 1 : 0; }

int deleteReportedFile(const std::string& path) {
    if (!fileExists(path)) return 1;
    if (fileDelete(path) != 0) {
        showMessage(MESSAGE_ERROR, "File could not be deleted");
        return 0;
    }
    return 1;
}
