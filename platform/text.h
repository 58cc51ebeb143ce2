#pragma once
// Text as the files of the design keep it: the engine holds UTF-8, the song's undo levels and
// the instrument definitions store UTF-16 units (little-endian on disk). These convert between
// the two without a locale.

#include <string>

// The UTF-16 units of text; a byte that does not start a valid, shortest UTF-8 sequence becomes
// U+FFFD.
std::u16string utf8ToUtf16(const std::string& text);
// The UTF-8 of units; a lone surrogate becomes U+FFFD.
std::string utf16ToUtf8(const std::u16string& units);
// The first units of text, at most limit, never ending inside a surrogate pair.
std::u16string cutUtf16(const std::u16string& units, size_t limit);
