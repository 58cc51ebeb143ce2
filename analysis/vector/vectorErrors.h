#pragma once
// Error reports of the vector library: fatal argument errors that end the process, and
// floating-point math errors that are reported once per (operation, type) pair while the
// operation goes on with a substitute value. Every report goes to a message box captioned
// with the program's file name. Logging to a file is not offered: the message box is the
// only output.

#include <string>

// Math error types, as numbered in the math error record.
enum MathErrorType {
    MATH_DOMAIN = 1,
    MATH_SING = 2,
    MATH_OVERFLOW = 3,
    MATH_UNDERFLOW = 4,
    MATH_TLOSS = 5,
    MATH_PLOSS = 6,
    MATH_STACK_FAULT = 7
};

// One math error as offered to the math error hook.
struct MathErrorRecord {
    int type;            // MathErrorType
    const char* name;    // failing operation, e.g. "VF_sqrt"
    double arg1;         // first argument
    double arg2;         // second argument, 0 when the operation takes one
    double retval;       // substitute result the operation continues with
};

struct VectorErrorState {
    std::string programName;            // command line or argv[0] the caption is taken from; set by start-up
    int lastComplexDoubleType;          // type of the last reported complex-double error, 0 when none
    std::string lastComplexDoubleName;  // its operation name
    int lastFloatType;                  // type of the last reported float error, 0 when none
    std::string lastFloatName;          // its operation name
};
extern VectorErrorState vectorErrorState;

// Remembers where the caption of the error boxes comes from (argv[0] or the command line).
void setVectorErrorCaption(const std::string& programName);
// The caption: the part after the last '/', at most 32 characters, then a trailing
// space and a trailing double quote removed; "Error" when nothing is left.
std::string vectorErrorCaption();
// Forgets the last reported math errors, so the next one of any kind is shown again.
void resetVectorErrors();

// Shows text in the error box; the floating-point environment is the same afterwards.
void showVectorError(const std::string& text);
// Formats format with name ("(8) %s: Size must be an integer power of 2.\n"), shows it,
// copies it to stderr and ends the process with exit status 1.
[[noreturn]] void fatalVectorError(const char* format, const char* name);

// Offers a math error of a float operation (or of a complex-double one) to the math error
// hook and, unless the hook handles it, reports "%s: %s error\n" when the (name, type)
// pair differs from the last one reported for that family.
void reportFloatMathError(const MathErrorRecord& record);
void reportComplexDoubleMathError(const MathErrorRecord& record);

// The run-time's math error hook: returns nonzero when it has handled the record. It
// declines every record.
int vectorMathErrorHook(MathErrorRecord& record);
