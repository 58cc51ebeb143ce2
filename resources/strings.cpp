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
    {10350, "Sorry - At least one note needs to be in the song to do this."},
    {10351, "Disk space is low on the 'Torvellan Shared' drive which could cause future editing and recording "
            "operations to fail. It is recommended that you choose a folder from recording preferences on a drive "
            "with more than 250Mb free space."},
    {10352, "Sorry - disk space is very low on the 'Torvellan Shared' drive so this operation cannot be performed. "
            "It is recommended that you choose a folder from recording preferences on a drive with more than 250Mb "
            "free space."},
    {10353, "Updating undo buffer..."},
    {10354, "Reading undo buffer..."},
    {10355, "Pasting..."},
    {10356, "Copying..."},
    {10357, "Deleting..."},
    {10367, "Recording Level"},
    {10380, "Quantizing pitch"},
    {10381, "Adjusting volume"},
    {10384, "Adjusting pitch..."},
    {10399, " seconds"},
    {10400, "Sorry - the new note cannot be created as it would be longer than the maximum allowed duration of "},
    {10401, "Sorry - there is insufficient memory available to continue. Please try freeing up some memory "
            "from other applications."},
    {10402, "Tip: To insert notes instead of just placing, copy and paste in Wave mode"},
    {10403, "Tip: To place notes without inserting, copy and paste in MIDI mode"},
    {10404, "Having problems recording? Click here to adjust settings"},
    {10413, "Adjusting pitch"},
    {10417, "Adjusting timing"},
};

std::string resourceString(int id) {
    for (const ResourceStringEntry& entry : resourceStrings)
        if (entry.id == id) return entry.text;
    return "";
}
