#pragma once
// The string table: texts the program refers to by number (captions, the memory message, the
// file routines' texts). Every unit that shows a numbered text fetches it here.

#include <string>

// The text of string id, word for word; "" for a number the table does not hold.
std::string resourceString(int id);
