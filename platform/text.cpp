// UTF-8 and UTF-16 conversions.
#include "platform/text.h"

// The next code point of text from i (advanced past it); a byte that does not start a valid,
// shortest UTF-8 sequence gives U+FFFD and is passed over alone.
static uint32_t nextCodePoint(const std::string& text, size_t& i) {
    uint32_t c = uint8_t(text[i]);
    int extra = c < 0x80 ? 0 : (c >> 5) == 6 ? 1 : (c >> 4) == 14 ? 2 : (c >> 3) == 30 ? 3 : -1;
    if (extra == 0) {
        i++;
        return c;
    }
    if (extra < 0 || i + size_t(extra) >= text.size()) {
        i++;
        return 0xFFFD;
    }
    uint32_t value = c & (0x3Fu >> extra);
    for (int k = 1; k <= extra; k++) {
        uint32_t next = uint8_t(text[i + size_t(k)]);
        if ((next >> 6) != 2) {
            i++;
            return 0xFFFD;
        }
        value = value << 6 | (next & 0x3F);
    }
    static const uint32_t smallest[] = {0, 0x80, 0x800, 0x10000};
    if (value < smallest[extra] || value > 0x10FFFF || (value >= 0xD800 && value < 0xE000)) {
        i++;
        return 0xFFFD;
    }
    i += size_t(extra) + 1;
    return value;
}

static void appendUtf8(std::string& text, uint32_t c) {
    if (c < 0x80) {
        text += char(c);
    } else if (c < 0x800) {
        text += char(0xC0 | c >> 6);
        text += char(0x80 | (c & 0x3F));
    } else if (c < 0x10000) {
        text += char(0xE0 | c >> 12);
        text += char(0x80 | (c >> 6 & 0x3F));
        text += char(0x80 | (c & 0x3F));
    } else {
        text += char(0xF0 | c >> 18);
        text += char(0x80 | (c >> 12 & 0x3F));
        text += char(0x80 | (c >> 6 & 0x3F));
        text += char(0x80 | (c & 0x3F));
    }
}

std::u16string utf8ToUtf16(const std::string& text) {
    std::u16string units;
    for (size_t i = 0; i < text.size();) {
        uint32_t c = nextCodePoint(text, i);
        if (c >= 0x10000) {
            units += char16_t(0xD800 + ((c - 0x10000) >> 10));
            units += char16_t(0xDC00 + ((c - 0x10000) & 0x3FF));
        } else {
            units += char16_t(c);
        }
    }
    return units;
}

std::string utf16ToUtf8(const std::u16string& units) {
    std::string text;
    for (size_t i = 0; i < units.size(); i++) {
        uint32_t u = units[i];
        if (u >= 0xD800 && u < 0xDC00 && i + 1 < units.size() && units[i + 1] >= 0xDC00 && units[i + 1] < 0xE000) {
            appendUtf8(text, 0x10000 + ((u - 0xD800) << 10) + (uint32_t(units[i + 1]) - 0xDC00));
            i++;
        } else if (u >= 0xD800 && u < 0xE000) {
            appendUtf8(text, 0xFFFD);
        } else {
            appendUtf8(text, u);
        }
    }
    return text;
}

std::u16string cutUtf16(const std::u16string& units, size_t limit) {
    if (units.size() <= limit) return units;
    size_t end = limit;
    if (end > 0 && units[end - 1] >= 0xD800 && units[end - 1] < 0xDC00) end--;
    return units.substr(0, end);
}
