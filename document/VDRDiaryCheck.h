#pragma once

#include <QString>
#include <QStringList>

// A read-only look at a diary file, its working copy and backups, for integrity checks from the
// command line: nothing is written, not even the lock probe's dummy row.
class VDRDiaryCheck
{
public:
    enum Status
    {
        CanBeOpened = 0,
        Missing,
        Damaged,
        Held,
        Newer,
        Refused // opening would refuse it for another reason, given in 'reason'
    };

    struct Result
    {
        Status status = Missing;
        QString integrity; // "ok" or the first problem SQLite reports
        QString version;   // "fileversion", empty when unreadable
        bool workingCopyExists = false;
        bool workingCopyHeld = false;
        QStringList lockInfo; // user, computer, date, time
        QStringList backups;  // newest first
        QString reason;       // why opening would refuse it
    };

    // Predicts what opening the diary would do, and leaves every file as it was.
    static Result inspect(const QString& path);
    // True when a running instance holds this working copy (read-only probe, no waiting).
    static bool isHeld(const QString& workingCopy);
    static QStringList existingBackups(const QString& path);
};
