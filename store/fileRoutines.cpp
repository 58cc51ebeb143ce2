// The song store's file routines, each reporting its own failure in an error box.
#include "store/fileRoutines.h"

#include <algorithm>
#include <memory>
#include <new>

#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "resources/strings.h"

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

// Copies are made in pieces of this size.
static const size_t COPY_PIECE_BYTES = 1 << 20;

int copyReportedFile(const std::string& from, const std::string& to) {
    std::unique_ptr<uint8_t[]> piece(allocationAllowed() ? new (std::nothrow) uint8_t[COPY_PIECE_BYTES] : nullptr);
    if (!piece) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    FILE* in = openReportedFile(from, "rb");
    if (!in) return 0;
    std::string part = to + ".part";
    FILE* out = openReportedFile(part, "wb");
    if (!out) {
        fileClose(in);
        return 0;
    }
    // A read that stops before the length the file had is a failure, not its end.
    int64_t length = fileSize(from);
    int copied = length >= 0 ? 1 : 0;
    for (int64_t done = 0; copied && done < length;) {
        size_t wanted = size_t(std::min<int64_t>(int64_t(COPY_PIECE_BYTES), length - done));
        size_t got = fileRead(piece.get(), wanted, in);
        if (got != wanted) {
            showMessage(MESSAGE_ERROR, "Cannot " + from);
            copied = 0;
        } else if (!writeReportedBytes(out, piece.get(), got)) {
            copied = 0;
        }
        done += int64_t(got);
    }
    fileClose(in);
    if (!closeReportedFile(out)) copied = 0;
    if (copied && renameFile(part, to) != 0) {
        showMessage(MESSAGE_ERROR, "Cannot " + to);
        copied = 0;
    }
    if (!copied) fileDelete(part);
    return copied;
}
