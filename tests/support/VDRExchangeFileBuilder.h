#pragma once

#include <QByteArray>
#include <QDateTime>
#include <QSqlDatabase>
#include <QString>
#include <QVariant>

// Writes an exchange file the way the mobile app does: the reference schema, the meta keys, and
// rows whose ids are the app's own (they start far from the diary's). Missing NOT NULL values are
// filled with plain defaults, so a test names only what it cares about.
class VDRExchangeFileBuilder
{
public:
    // 'diaryFileName' is the meta key `database` (file name of the diary, with extension).
    VDRExchangeFileBuilder(const QString& path, const QString& diaryFileName,
                           const QDateTime& created = QDateTime(QDate(2026, 3, 7), QTime(16, 5, 9)));
    // Adds to a file written before.
    explicit VDRExchangeFileBuilder(const QString& existingPath);
    ~VDRExchangeFileBuilder();
    VDRExchangeFileBuilder(const VDRExchangeFileBuilder&) = delete;
    VDRExchangeFileBuilder& operator=(const VDRExchangeFileBuilder&) = delete;

    bool isOk() const { return m_ok; }
    QSqlDatabase db() const;
    // Closes the file; the builder is done.
    void close();

    // A meta value; a null value removes the key.
    bool setMeta(const QString& key, const QVariant& value);
    bool exec(const QString& sql);

    // One row; returns its id (the app's), -1 on failure.
    int addRow(const QString& table, const QVariantHash& values = QVariantHash());
    // A report dated 'date' numbered 'number' by author "AB", created at 'created' (its identity).
    int addReport(const QString& number, const QDate& date, const QDateTime& created,
                  const QVariantHash& values = QVariantHash());
    // A small JPEG of the given colour; returns the image id.
    int addImage(const QColor& colour);
    // Every list of a report with one row (workforce with a time recording, each progress type,
    // both task types), three photos (one assigned to the deficiency) and a dictation.
    bool addFullReportContent(int entryId);

    static QByteArray jpeg(const QColor& colour, int width = 64, int height = 48);

private:
    QString m_name;
    bool m_ok = false;
    QHash<QString, int> m_nextId;
};
