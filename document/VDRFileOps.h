#pragma once

#include <QString>

#include <functional>

// File operations on diaries, working copies and backups. They go through one place so that
// tests can make a chosen operation fail (a full disk, a pulled stick, a read-only folder).
class VDRFileOps
{
public:
    enum Op { Copy, Rename, Remove, Write, CheckWritable };

    static bool copy(const QString& source, const QString& target);
    static bool rename(const QString& source, const QString& target);
    static bool remove(const QString& path);
    // Removes an SQLite file with its journal: a stale journal beside a new file of the same name
    // would be taken for that file's own and rolled into it.
    static bool removeDatabase(const QString& path);
    // Writes the bytes to a temporary file beside 'path', flushes it to disk and renames it into place.
    static bool writeFileAtomically(const QString& path, const QByteArray& bytes);
    static bool isWritable(const QString& path);
    // Copies to a temporary name beside 'target', flushes it to disk, then renames it over 'target',
    // so that 'target' is at every instant either absent/old or the complete copy.
    static bool copyDurably(const QString& source, const QString& target);

    // Test hook: return true to make the operation on 'path' fail. Null restores normal behaviour.
    using FailurePredicate = std::function<bool(Op op, const QString& path)>;
    static void setFailurePredicate(FailurePredicate predicate);

private:
    static bool shouldFail(Op op, const QString& path);
};
