#include "harness/CommandLine.h"

#include <iostream>
#include <stdexcept>

#include <QCoreApplication>

void parseCommandLine(QCommandLineParser& parser, int argumentCount, char** arguments,
                      int maxPositional)
{
    parser.addOption({"help", "Print this text."});
    QStringList list;
    for (int index = 0; index < argumentCount; ++index)
        list.append(QString::fromLocal8Bit(arguments[index]));
    parser.setSingleDashWordOptionMode(QCommandLineParser::ParseAsLongOptions);
    if (!parser.parse(list))
        throw std::runtime_error(parser.errorText().toStdString() + " See --help.");
    if (parser.positionalArguments().size() > maxPositional)
        throw std::runtime_error("Unexpected argument '" +
                                 parser.positionalArguments().last().toStdString() +
                                 "'. See --help.");
}

bool printHelp(const QCommandLineParser& parser, int argumentCount, char** arguments)
{
    if (!parser.isSet("help"))
        return false;
    const QCoreApplication application(argumentCount, arguments); // names the program
    std::cout << parser.helpText().toStdString();
    return true;
}
