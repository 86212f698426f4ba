#include "sync/VDRExchangeValues.h"
#include "sync/VDRReportSynchronisation.h"

#include <climits>
#include <cmath>

namespace VDRExchangeValues {

namespace {
QString tr(const char* text)
{
    return VDRReportSynchronisation::tr(text);
}

QString shortened(const QString& text)
{
    return text.size() > 40 ? text.left(40) + QStringLiteral("...") : text;
}

bool invalid(const QVariant& raw, const QString& name, QString& error)
{
    error = tr("Die Spalte '%1' enthält einen ungültigen Wert: %2")
                .arg(name, shortened(raw.type() == QVariant::ByteArray ? QStringLiteral("<BLOB>")
                                                                       : raw.toString()));
    return false;
}

bool missing(const QString& name, QString& error)
{
    error = tr("Die Spalte '%1' enthält keinen Wert.").arg(name);
    return false;
}

bool convertInt(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    if (raw.isNull()) {
        out = column.notNull ? QVariant(0) : QVariant(QVariant::Int);
        return true;
    }
    bool ok = false;
    qint64 value = 0;
    if (raw.type() == QVariant::Double) {
        const double d = raw.toDouble();
        ok = std::isfinite(d) && d == std::floor(d) && std::fabs(d) < 1e15;
        value = static_cast<qint64>(d);
    } else if (raw.type() != QVariant::ByteArray) {
        value = raw.toString().trimmed().toLongLong(&ok);
    }
    if (!ok || value < INT_MIN || value > INT_MAX)
        return invalid(raw, QLatin1String(column.name), error);
    out = static_cast<int>(value);
    return true;
}

bool convertReal(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    if (raw.isNull()) {
        out = column.notNull ? QVariant(0.0) : QVariant(QVariant::Double);
        return true;
    }
    bool ok = false;
    const double value = raw.type() == QVariant::ByteArray ? 0.0 : raw.toString().trimmed().toDouble(&ok);
    if (!ok || !std::isfinite(value))
        return invalid(raw, QLatin1String(column.name), error);
    out = value;
    return true;
}

bool convertText(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    if (raw.isNull()) {
        out = column.kind == KTextOrNull ? QVariant(QVariant::String) : QVariant(QStringLiteral(""));
        return true;
    }
    const QString text =
        raw.type() == QVariant::ByteArray ? QString::fromUtf8(raw.toByteArray()) : raw.toString();
    if (text.size() > VDRReportSynchronisation::maxTextChars()) {
        error = tr("Der Text der Spalte '%1' ist zu lang (%2 Zeichen).")
                    .arg(QLatin1String(column.name))
                    .arg(text.size());
        return false;
    }
    out = text;
    return true;
}

// An empty date or time is no value: NULL where the column allows it.
bool convertEmpty(const Column& column, QVariant::Type type, QVariant& out, QString& error)
{
    if (column.notNull)
        return missing(QLatin1String(column.name), error);
    out = QVariant(type);
    return true;
}

bool convertDate(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    if (raw.isNull() || raw.toString().trimmed().isEmpty())
        return convertEmpty(column, QVariant::Date, out, error);
    QString text = raw.toString().trimmed();
    if (text.size() > 10 && (text.at(10) == QLatin1Char('T') || text.at(10) == QLatin1Char(' ')))
        text.truncate(10);
    const QDate date = QDate::fromString(text, Qt::ISODate);
    if (!date.isValid() || text.size() != 10)
        return invalid(raw, QLatin1String(column.name), error);
    out = date;
    return true;
}

bool convertTime(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    if (raw.isNull() || raw.toString().trimmed().isEmpty())
        return convertEmpty(column, QVariant::Time, out, error);
    QString text = raw.toString().trimmed();
    const int t = text.indexOf(QLatin1Char('T'));
    if (t >= 0)
        text = text.mid(t + 1);
    QTime time = QTime::fromString(text, Qt::ISODateWithMs);
    if (!time.isValid())
        time = QTime::fromString(text, Qt::ISODate);
    if (!time.isValid())
        return invalid(raw, QLatin1String(column.name), error);
    out = time;
    return true;
}

// A date and time is stored as text, the way the diary writes versions.
bool convertDateTime(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    if (raw.isNull() || raw.toString().trimmed().isEmpty())
        return convertEmpty(column, QVariant::String, out, error);
    const QDateTime dateTime = parseDateTime(raw.toString());
    if (!dateTime.isValid())
        return invalid(raw, QLatin1String(column.name), error);
    out = versionText(dateTime);
    return true;
}

bool convertBlob(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    const QString name = QLatin1String(column.name);
    if (raw.isNull()) {
        if (column.notNull)
            return missing(name, error);
        out = QVariant(QVariant::ByteArray);
        return true;
    }
    if (raw.type() != QVariant::ByteArray)
        return invalid(raw, name, error);
    const QByteArray bytes = raw.toByteArray();
    if (bytes.size() > VDRReportSynchronisation::maxBlobBytes()) {
        error = tr("Der Inhalt der Spalte '%1' ist zu groß (%2 MB).").arg(name).arg(bytes.size() / 1024000);
        return false;
    }
    if (column.notNull && bytes.isEmpty())
        return missing(name, error);
    out = bytes;
    return true;
}
} // namespace

QDateTime parseDateTime(const QString& text)
{
    QString t = text.trimmed();
    if (t.size() > 10 && t.at(10) == QLatin1Char(' '))
        t[10] = QLatin1Char('T');
    QDateTime result = QDateTime::fromString(t, Qt::ISODateWithMs);
    if (!result.isValid())
        result = QDateTime::fromString(t, Qt::ISODate);
    return result;
}

QString versionText(const QDateTime& dateTime)
{
    QString text = dateTime.toString(QStringLiteral("yyyy-MM-ddThh:mm:ss"));
    if (dateTime.time().msec() != 0)
        text += dateTime.toString(QStringLiteral(".zzz"));
    return text;
}

// Checks one value of the exchange file against its column and turns it into what the diary's
// own models would bind. False with 'error' set when the value cannot be taken.
bool convertValue(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    switch (column.kind) {
    case KInt:
        return convertInt(raw, column, out, error);
    case KReal:
        return convertReal(raw, column, out, error);
    case KText:
    case KTextOrNull:
        return convertText(raw, column, out, error);
    case KDate:
        return convertDate(raw, column, out, error);
    case KTime:
        return convertTime(raw, column, out, error);
    case KDateTime:
        return convertDateTime(raw, column, out, error);
    case KBlob:
        return convertBlob(raw, column, out, error);
    }
    return invalid(raw, QLatin1String(column.name), error);
}

} // namespace VDRExchangeValues
