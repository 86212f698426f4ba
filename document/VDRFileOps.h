#pragma once

#include <QFileDevice>
#include <QString>
#include <QStringList>

#include <functional>

// File operations on diaries, working copies and backups. They go through one place so that
// tests can make a chosen operation fail (a full disk, a pulled stick, a read-only folder).
class VDRFileOps
{
public:
    enum Op
    {
        Copy,
        Rename,
        Remove,
        Write,
        CheckWritable,
        Link,
        SyncFolder
    };

    static bool copy(const QString& source, const QString& target);
    static bool rename(const QString& source, const QString& target);
    static bool remove(const QString& path);
    // Removes an SQLite file with its journal: a stale journal beside a new file of the same name
    // would be taken for that file's own and rolled into it.
    static bool removeDatabase(const QString& path);
    // A second name for an existing file (a hard link); fails where the file system has none.
    static bool link(const QString& existing, const QString& newName);
    // Rename, or copy and remove where a rename cannot cross file systems.
    static bool move(const QString& source, const QString& target);
    // Writes the bytes to a temporary file beside 'path', flushes it to disk and renames it into place.
    static bool writeFileAtomically(const QString& path, const QByteArray& bytes);
    static bool isWritable(const QString& path);

    // Copies 'source' to a new temporary file beside 'target' and flushes it to disk. Returns the
    // temporary file's name, empty on failure (nothing is left behind then).
    static QString writeDurableCopy(const QString& source, const QString& target);
    // The same without flushing, for a caller that flushes the copy itself (flush()).
    static QString writeCopy(const QString& source, const QString& target);
    // A new empty file under a temporary name beside 'target', for a writer that makes the contents itself.
    static QString emptyTemporaryBeside(const QString& target);
    // Flushes a finished file to disk.
    static bool flush(const QString& path);
    // Renames 'temporary' over 'target' in one step, keeping the permissions of the file it
    // replaces, and makes the rename itself durable. 'renamed' tells a caller that must not undo
    // anything whether the rename happened even though flushing the folder failed.
    // Permissions a newly created file gets from the process's umask (rw for whom it allows).
    static QFileDevice::Permissions newFilePermissions();
    static bool replaceFile(const QString& temporary, const QString& target, bool* renamed = nullptr);
    // writeDurableCopy and replaceFile: 'target' is at every instant absent/old or the complete copy.
    static bool copyDurably(const QString& source, const QString& target);
    // Deletes a file in the background: a large backup takes a while to free on some file systems,
    // and nobody waits for it. The file first gets a temporary name beside 'neighbour' so that a
    // crash leaves only a leftover the next opening removes.
    static void removeInBackground(const QString& path, const QString& neighbour);
    // Waits until every removal started by removeInBackground has finished.
    static void waitForBackgroundRemovals();
    // Temporary files a durable copy or a background removal beside 'target' left behind when it
    // was interrupted.
    static QStringList leftoverTemporaries(const QString& target);

    // Why the last failed file operation failed, as the operating system says it in the
    // user's language ("Auf dem Gerät ist kein Speicherplatz mehr verfügbar."); empty when unknown.
    static QString lastErrorText();
    static QString reasonText(int errorNumber);
    // 'text' followed by the reason of the last failure on a line of its own, when there is one.
    static QString withReason(const QString& text);

    // Test hook: return true to make the operation on 'path' fail. Null restores normal behaviour.
    using FailurePredicate = std::function<bool(Op op, const QString& path)>;
    static void setFailurePredicate(FailurePredicate predicate);
    // The error an injected failure reports (EIO unless set).
    static void setFailureErrno(int errorNumber);

private:
    static bool shouldFail(Op op, const QString& path);
    static bool syncFolderOf(const QString& path);
    static void setLastError(int errorNumber);
    static QString copyToTemporary(const QString& source, const QString& target, bool flush);
};
