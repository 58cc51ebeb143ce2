// Error reports of the vector library: the caption of the error box, the fatal argument
// errors and the once-per-pair math error reports.
#include "analysis/vector/vectorErrors.h"

#include <cfenv>
#include <cstdio>
#include <cstdlib>
#include <mutex>

#include "platform/ui.h"

VectorErrorState vectorErrorState;

static const char* const mathErrorWords[] = {
    "", "DOMAIN", "SING", "OVERFLOW", "UNDERFLOW", "TLOSS", "PLOSS", "STACK FAULT"};

void setVectorErrorCaption(const std::string& programName) {
    vectorErrorState.programName = programName;
}

std::string vectorErrorCaption() {
    const std::string& name = vectorErrorState.programName;
    size_t slash = name.rfind('/');
    std::string caption = slash == std::string::npos ? name : name.substr(slash + 1);
    if (caption.size() > 32) caption.resize(32);
    // A quoted program path on a command line ends in '"' and often a space before the arguments.
    if (!caption.empty() && caption.back() == ' ') caption.pop_back();
    if (!caption.empty() && caption.back() == '"') caption.pop_back();
    return caption.empty() ? "Error" : caption;
}

void resetVectorErrors() {
    vectorErrorState.lastComplexDoubleType = 0;
    vectorErrorState.lastComplexDoubleName.clear();
    vectorErrorState.lastFloatType = 0;
    vectorErrorState.lastFloatName.clear();
}

void showVectorError(const std::string& text) {
    // The box may run other code (an event loop) that leaves exception flags or a
    // rounding mode behind; the reporting operation goes on with its own.
    std::fenv_t savedEnvironment;
    std::fegetenv(&savedEnvironment);
    messageBox(vectorErrorCaption(), text, MESSAGE_ERROR, BUTTONS_OK);
    std::fesetenv(&savedEnvironment);
}

void fatalVectorError(const char* format, const char* name) {
    char text[256];
    std::snprintf(text, sizeof text, format, name);
    // Also on stderr: the process ends right after the box, and a box may not be seen.
    std::fputs(text, stderr);
    showVectorError(text);
    std::fflush(nullptr);
    // Other threads may still be running; static destructors must not run under them.
    std::_Exit(1);
}

int vectorMathErrorHook(MathErrorRecord&) {
    return 0;
}

static void reportMathError(const MathErrorRecord& record, int& lastType, std::string& lastName) {
    MathErrorRecord offered = record;
    if (vectorMathErrorHook(offered)) return;
    {
        // Analysis threads may report at the same time; only the comparison is guarded.
        static std::mutex lastErrorLock;
        std::lock_guard<std::mutex> guard(lastErrorLock);
        if (record.type == lastType && lastName == record.name) return;
        lastType = record.type;
        lastName = record.name;
    }
    const char* word = record.type >= MATH_DOMAIN && record.type <= MATH_STACK_FAULT
                           ? mathErrorWords[record.type] : "unknown";
    char text[128];
    std::snprintf(text, sizeof text, "%s: %s error\n", record.name, word);
    showVectorError(text);
}

void reportFloatMathError(const MathErrorRecord& record) {
    reportMathError(record, vectorErrorState.lastFloatType, vectorErrorState.lastFloatName);
}

void reportComplexDoubleMathError(const MathErrorRecord& record) {
    reportMathError(record, vectorErrorState.lastComplexDoubleType, vectorErrorState.lastComplexDoubleName);
}
