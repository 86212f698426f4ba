// Test helper: holds a diary open in a process of its own, like a running instance of the
// application. Reads commands from stdin: "modify" changes the project name without saving,
// "quit" closes the diary properly. Killing it leaves the working copy as a crash would.
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"

#include <QCoreApplication>
#include <QTextStream>

#include <cstdio>
#include <iostream>
#include <string>

int main(int argc, char* argv[])
{
    QCoreApplication app(argc, argv);
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software"));
    QCoreApplication::setApplicationName(QStringLiteral("Varduna"));
    if (argc < 2)
        return 1;
    VDRDocument doc;
    bool showError = true;
    if (!doc.openDocument(QString::fromLocal8Bit(argv[1]), showError)) {
        std::puts("failed");
        return 2;
    }
    std::puts("ready");
    std::fflush(stdout);
    std::string line;
    while (std::getline(std::cin, line)) {
        if (line == "modify") {
            doc.modelVdr()->setData(0, QStringLiteral("name"), QStringLiteral("Geändert im Holder"));
            doc.modelVdr()->submitAll();
            std::puts("modified");
            std::fflush(stdout);
        } else if (line == "quit") {
            break;
        }
    }
    doc.closeDocument();
    return 0;
}
