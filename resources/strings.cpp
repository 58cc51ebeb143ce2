// The string table, kept as one list of numbered texts.
#include "resources/strings.h"

struct ResourceStringEntry {
    int id;              // string number
    const char* text;    // the text, exactly as the user reads it
};

static const ResourceStringEntry resourceStrings[] = {
    {189, "Instrument recordings"},
    {10230, "File could not be closed"},
    {10231, "File could not be seeked"},
    {10232, "Bytes were not stored properly"},
    {10271, "Made with Torvellan Melodrift"},
    {10296, "Waveview display"},
    {10297, "Analysing wave"},
    {10325, "Message from Torvellan Melodrift"},
    {10367, "Recording Level"},
    {10401, "Sorry - there is insufficient memory available to continue. Please try freeing up some memory "
            "from other applications."},
    {10404, "Having problems recording? Click here to adjust settings"},
};

std::string resourceString(int id) {
    for (const ResourceStringEntry& entry : resourceStrings)
        if (entry.id == id) return entry.text;
    return "";
}
