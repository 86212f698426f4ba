#pragma once

#include <QSqlDatabase>
#include <QString>
#include <QStringList>
#include <QVariant>

class VDRDocument;

// Fixtures built in code: diaries in the current and older layouts, damaged files, isolated settings.
namespace VDRTestFixtures {

// Settings go to a folder of the test's own; call before anything reads QSettings.
void isolateSettings(const QString& folder);
// Settings and temporary files (TMPDIR) of this run both go below 'folder'; returns the
// temporary folder, empty when it cannot be made.
QString isolateRun(const QString& folder);

// A new diary written to 'path' exactly as the application creates and saves one.
bool createDiary(const QString& path);

// The oldest layout the upgrades know: every upgrade step has work to do. Holds one report with
// workforce rows in the three-pair layout, materials with OK flags, progress rows with NOT NULL dates.
bool createOldestLayoutDiary(const QString& path, const QString& fileVersion = QStringLiteral("0.1"));

// Opens a diary as the window does (errors shown); false when it is refused.
bool openDiary(VDRDocument& doc, const QString& path);
// An unsaved change to the open diary: its project's new name.
bool setProjectName(VDRDocument& doc, const QString& name);
// Saves the diary once per name, each in an opening of its own: a backup generation per name.
bool saveGenerations(const QString& path, const QStringList& names);
// The project name a diary file holds, and whether SQLite's quick check finds it intact.
QString projectNameIn(const QString& path);
bool isIntact(const QString& path);
bool writeFile(const QString& path, const QByteArray& bytes);

// On an open document's own connection: its working copy is locked against any other.
bool execOn(QSqlDatabase db, const QStringList& statements);
// As queryTexts; a failed query shows as its error.
QStringList textsOn(QSqlDatabase db, const QString& sql);

// SQL for one open report row 'number', 5 March 2024 from 07:00 to 16:30 by author AB, texts blank.
QString reportInsertSql(int id, const QString& number);

// SQL for one JPEG picture row of 'bytes' zero bytes (a 1x1 picture as far as the row says).
QString imageInsertSql(qint64 bytes);

// Runs statements on a closed file; returns false on the first failure.
bool execSql(const QString& path, const QStringList& statements);
QVariant queryValue(const QString& path, const QString& sql);
QList<QVariantList> queryRows(const QString& path, const QString& sql);
// One text per row, values joined by "|", NULL shown as "NULL": readable when a comparison fails.
QStringList queryTexts(const QString& path, const QString& sql);

// "name type notnull default pk" per column, in order, for comparing structures.
QStringList tableLayout(const QString& path, const QString& table);
QStringList tableNames(const QString& path);

// SHA-256 of a file's bytes (empty when it cannot be read): shows that a file was left untouched.
QByteArray fileHash(const QString& path);

// Every file in a folder with its hash: shows that nothing beside a diary changed.
QStringList folderState(const QString& folder);

// Overwrites bytes in the middle of the file so that SQLite sees a damaged b-tree.
bool damageFile(const QString& path);
// Overwrites the schema page's b-tree header: SQLite cannot even run its integrity check.
bool damageSchemaPage(const QString& path);

// Makes a file or folder immutable (chattr +i), so that not even root may change it; false where
// the file system or the user cannot.
bool setImmutable(const QString& path, bool immutable);

// A real, small tmpfs mounted at 'folder' for full-disk tests, where the test may
// mount one (as root); isMounted() tells. Unmounted on destruction.
class SmallDisk
{
public:
    SmallDisk(const QString& folder, qint64 bytes);
    ~SmallDisk();
    SmallDisk(const SmallDisk&) = delete;
    SmallDisk& operator=(const SmallDisk&) = delete;
    bool isMounted() const { return m_mounted; }
    // Fills the disk up to the last byte with a file of its own.
    bool fill();

private:
    QString m_folder;
    bool m_mounted = false;
};

// Standard output of a program run with an argument list (empty when it does not finish).
QString tool(const QString& program, const QStringList& args);

// A run of the command-line tool beside the test; it reads the run's isolated settings.
struct CliRun
{
    int exitCode = -1; // -1: it crashed or did not finish
    QString out;
    QString err;
};
CliRun runCli(const QStringList& args);
// The text of a PDF, or of one of its pages (from 1), as pdftotext -layout reads it.
QString pdfText(const QString& pdf, int page = 0);
int pdfPages(const QString& pdf);

} // namespace VDRTestFixtures
