// melodrift-cli: the engine driven from the command line. It goes through the program's
// own start-up and shut-down (paths, settings, the single-instance lock on the shared
// folder, clean-up of working files), runs one command on the main loop and exits with
// the command's result.
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "analysis/vector/vectorErrors.h"
#include "cli/cliCommands.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/startup.h"

// Exit codes beyond the commands' own.
static const int EXIT_USAGE = 2;          // the command line was not understood
static const int EXIT_NOT_STARTED = 3;    // start-up stopped early (its message is on stderr)

static void printUsage(FILE* out) {
    std::fprintf(out,
                 "Usage: melodrift-cli [--shared DIR] [--config DIR] [--keep-working-files] COMMAND ARGUMENTS...\n"
                 "\n"
                 "Options:\n"
                 "  --shared DIR   keep the working files in DIR/Torvellan Shared/ instead of the\n"
                 "                 configured shared folder\n"
                 "  --config DIR   read and write the settings in DIR instead of the user's\n"
                 "                 configuration folder (same as MELODRIFT_CONFIG_DIR)\n"
                 "  --keep-working-files\n"
                 "                 leave the song's working files (CS.fw, the FT and Hires FT files,\n"
                 "                 CSUndo) in the shared folder at exit; the next start clears them\n"
                 "\n"
                 "Commands:\n");
    // Each command on one line with its arguments, its summary indented below.
    for (const CliCommand& command : cliCommands())
        std::fprintf(out, "  %s %s\n      %s\n", command.name, command.usage, command.summary);
}

int main(int argc, char** argv) {
    setVectorErrorCaption(argv[0]);
    std::vector<std::string> words(argv + 1, argv + argc);
    StartupOptions options{};
    size_t next = 0;
    while (next < words.size() && words[next].rfind("--", 0) == 0) {
        const std::string& option = words[next];
        if (option == "--help") {
            printUsage(stdout);
            return 0;
        }
        if (option == "--keep-working-files") {
            options.keepWorkingFiles = true;
            next++;
            continue;
        }
        if (next + 1 >= words.size() || (option != "--shared" && option != "--config")) {
            std::fprintf(stderr, "melodrift-cli: unknown option or missing folder: %s\n\n", option.c_str());
            printUsage(stderr);
            return EXIT_USAGE;
        }
        if (option == "--shared") options.sharedBasePath = words[next + 1];
        else setenv("MELODRIFT_CONFIG_DIR", words[next + 1].c_str(), 1);
        next += 2;
    }
    if (next >= words.size()) {
        printUsage(stderr);
        return EXIT_USAGE;
    }
    const CliCommand* command = findCliCommand(words[next]);
    std::vector<std::string> arguments(words.begin() + long(next) + 1, words.end());
    if (!command || int(arguments.size()) < command->minArguments) {
        std::fprintf(stderr, "melodrift-cli: %s: %s\n\n", words[next].c_str(),
                     command ? "missing arguments" : "unknown command");
        printUsage(stderr);
        return EXIT_USAGE;
    }

    setUiEcho(true);
    if (!startUp(options)) return EXIT_NOT_STARTED;
    bool ran = false;
    postToMainLoop([command, arguments, &ran] {
        ran = true;
        postQuit(command->run(arguments));
    });
    int exitCode = runMessageLoop();
    // A start-up failure that set the quit flag skips the loop: the command never ran.
    return shutDown(ran ? exitCode : EXIT_NOT_STARTED);
}
