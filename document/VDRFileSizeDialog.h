#pragma once

#include <QCoreApplication>

class VDRDocument;

// After opening: suggests starting a follow-up diary when the file has grown past the configured
// size. Asked through the prompt interface so that tests and the command line can answer it.
class VDRFileSizeDialog
{
    Q_DECLARE_TR_FUNCTIONS(VDRFileSizeDialog)
public:
    enum Result
    {
        NotDue,
        Dismissed,
        ExportRequested
    };

    static QString fileSizeSettingsKey() { return QStringLiteral("file/FileSize"); }
    static int defaultFileSize() { return 100; }

    explicit VDRFileSizeDialog(VDRDocument* document) : m_document(document) {}

    // The file's size in MB when the warning is due, otherwise -1.
    int dueSizeMegabytes() const;
    // Asks when due. "Not again for this file" sets the flag and saves without a question.
    Result exec();

private:
    VDRDocument* m_document;
};
