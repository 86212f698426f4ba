#pragma once

#include <QDateTime>
#include <QString>
#include <QVariant>

// Values read from the app's files are checked against their column before they are bound.
namespace VDRExchangeValues {

enum Kind
{
    KInt,
    KReal,
    KText,       // NULL becomes the empty text
    KTextOrNull, // NULL stays NULL
    KDate,
    KTime,
    KDateTime,
    KBlob,
};

struct Column
{
    const char* name;
    Kind kind;
    bool notNull;
};

// Turns 'raw' into what the diary's own models would bind; false with a message in 'error' when
// the value cannot be taken (wrong type, invalid date, NULL where a value is needed, too large).
bool convertValue(const QVariant& raw, const Column& column, QVariant& out, QString& error);
// ISO 8601 with "T" or a blank between date and time, with or without milliseconds.
QDateTime parseDateTime(const QString& text);
// "yyyy-MM-ddThh:mm:ss", milliseconds only when there are some.
QString versionText(const QDateTime& dateTime);

} // namespace VDRExchangeValues
