// The command lines of the benchmark programs.
#pragma once

#include <QCommandLineParser>

// Adds --help, and parses the arguments of the process, of which the first is the program's name.
// Accepts at most `maxPositional` arguments that are not options. Throws std::runtime_error with
// the reason if the arguments are wrong. Requires no application object.
void parseCommandLine(QCommandLineParser& parser, int argumentCount, char** arguments,
                      int maxPositional = 0);

// Prints the help if --help was given. Returns whether it was.
[[nodiscard]] bool printHelp(const QCommandLineParser& parser, int argumentCount, char** arguments);
