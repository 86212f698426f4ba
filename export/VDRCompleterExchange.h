#pragma once

#include <QCoreApplication>
#include <QString>

// Copies the suggestion texts of every language between the application settings and the
// exchange file "Completer.xml" in a (cloud) folder, in the settings format "xml".
// File groups are named after the language ("German", "English", ...); the application keeps each
// language's lists in "completer_%1" with %1 the QLocale::Language number held under `language`.
class VDRCompleterExchange
{
    Q_DECLARE_TR_FUNCTIONS(VDRCompleterExchange)

public:
    static const QString LastSyncCompleterSettingsKey; // "syncCompleter/lastSyncCompleter"

    // Rewrites the file from the application settings and records its modification time.
    static bool exportSettings2XML(const QString& folder);
    // Replaces the lists of every language found in the file. A file that cannot be read changes
    // nothing; a malformed one is reported through the prompt with its line.
    static bool importSettingsFromXML(const QString& folder);
    // Writes the file from the application settings only when it is missing.
    static bool createCompleterXMLFile(const QString& folder);
    // Called after an import replaced lists, so that the window's live lists re-read them.
    static void setListsReplacedHandler(void (*handler)());

    static QString completerFilePath(const QString& folder);
    static QString completerGroup(int localeLanguage);

private:
    static void recordSyncDate(const QString& path);
};
