#include "document/CVdShared.h"

#include "document/VDRPrompt.h"

#include <QAbstractItemModel>
#include <QCoreApplication>
#include <QFileInfo>
#include <QSettings>
#include <QSqlQueryModel>
#include <QSqlRecord>

namespace {

struct CompanyFormats
{
    bool loaded = false;
    int format1[3] = {0, 4, 1};
    bool format1Field2InBrackets = false;
    bool format1Field3InBrackets = true;
    int format2[4] = {0, 3, 4, 1};
    bool format2Field3InBrackets = false;
    bool format2Field4InBrackets = true;
};

CompanyFormats& rawFormats()
{
    static CompanyFormats f;
    return f;
}

CompanyFormats& formats()
{
    CompanyFormats& f = rawFormats();
    // Read the user's formats on first use, so every caller (window, printouts, command line)
    // sees the same formats without having to load them first.
    if (!f.loaded)
        CVdShared::restoreCompanyOutputFormats();
    return f;
}

int validIndex(int index)
{
    return index >= 0 && index < CVdShared::companyFieldCount() ? index : 0;
}

QString key(const char* name)
{
    return CVdShared::companyOutputFormatsGroup() + QLatin1Char('/') + QLatin1String(name);
}

int readIndex(const QSettings& settings, const char* name, int fallback)
{
    bool ok = false;
    const int value = settings.value(key(name), fallback).toInt(&ok);
    return ok && value >= 0 && value < CVdShared::companyFieldCount() ? value : fallback;
}

QString format1(const QMap<QString, QString>& values, const QString& separator, bool brackets = true)
{
    const CompanyFormats& f = formats();
    QList<int> fields{f.format1[0], f.format1[1], f.format1[2]};
    if (!brackets) {
        // Bracketed positions left out: the plain ones remain in their order.
        if (f.format1Field3InBrackets)
            fields[2] = 0;
        if (f.format1Field2InBrackets)
            fields[1] = 0;
    }
    return CVdShared::formatCompany(fields, f.format1Field2InBrackets && brackets,
                                    f.format1Field3InBrackets && brackets, values, separator);
}

QString format2(const QMap<QString, QString>& values, const QString& separator, bool brackets = true)
{
    const CompanyFormats& f = formats();
    QList<int> fields{f.format2[0], f.format2[1], f.format2[2], f.format2[3]};
    if (!brackets) {
        if (f.format2Field4InBrackets)
            fields[3] = 0;
        if (f.format2Field3InBrackets)
            fields[2] = 0;
    }
    return CVdShared::formatCompany(fields, f.format2Field3InBrackets && brackets,
                                    f.format2Field4InBrackets && brackets, values, separator);
}

// The values of a model row by field name; empty for a missing model or row.
QMap<QString, QString> rowValues(const QAbstractItemModel* model, int row)
{
    QMap<QString, QString> values;
    if (!model || row < 0 || row >= model->rowCount())
        return values;
    const auto* sqlModel = qobject_cast<const QSqlQueryModel*>(model);
    const QStringList& fields = CVdShared::listIdx2CompanyField();
    for (int i = 1; i < fields.size(); ++i) {
        int column = -1;
        if (sqlModel) {
            column = sqlModel->record().indexOf(fields.at(i));
        } else {
            for (int c = 0; c < model->columnCount(); ++c) {
                if (model->headerData(c, Qt::Horizontal, Qt::EditRole).toString() == fields.at(i)) {
                    column = c;
                    break;
                }
            }
        }
        if (column >= 0)
            values.insert(fields.at(i), model->index(row, column).data(Qt::EditRole).toString());
    }
    return values;
}

QMap<QString, QString> looseValues(const QString& company, const QString& lastname, const QString& type)
{
    return {{QStringLiteral("company"), company},
            {QStringLiteral("lastname"), lastname},
            {QStringLiteral("type"), type}};
}

} // namespace

const QStringList& CVdShared::listIdx2CompanyField()
{
    static const QStringList fields{
        QStringLiteral("empty"),    QStringLiteral("type"),    QStringLiteral("firstname"),
        QStringLiteral("lastname"), QStringLiteral("company"), QStringLiteral("street"),
        QStringLiteral("plz"),      QStringLiteral("city"),    QStringLiteral("telephone"),
        QStringLiteral("telefax"),  QStringLiteral("mobile"),  QStringLiteral("email"),
    };
    return fields;
}

QString CVdShared::getCompanyFieldByIndex(int index)
{
    return index >= 0 && index < companyFieldCount() ? listIdx2CompanyField().at(index) : QString();
}

int CVdShared::getListIdxByCompanyField(const QString& field)
{
    return listIdx2CompanyField().indexOf(field);
}

void CVdShared::restoreCompanyOutputFormats()
{
    CompanyFormats& f = rawFormats();
    const CompanyFormats defaults;
    QSettings settings;
    f.format1[0] = readIndex(settings, "format1Field1", defaults.format1[0]);
    f.format1[1] = readIndex(settings, "format1Field2", defaults.format1[1]);
    f.format1[2] = readIndex(settings, "format1Field3", defaults.format1[2]);
    f.format1Field2InBrackets =
        settings.value(key("format1Field2InBrackets"), defaults.format1Field2InBrackets).toBool();
    f.format1Field3InBrackets =
        settings.value(key("format1Field3InBrackets"), defaults.format1Field3InBrackets).toBool();
    f.format2[0] = readIndex(settings, "format2Field1", defaults.format2[0]);
    f.format2[1] = readIndex(settings, "format2Field2", defaults.format2[1]);
    f.format2[2] = readIndex(settings, "format2Field3", defaults.format2[2]);
    f.format2[3] = readIndex(settings, "format2Field4", defaults.format2[3]);
    f.format2Field3InBrackets =
        settings.value(key("format2Field3InBrackets"), defaults.format2Field3InBrackets).toBool();
    f.format2Field4InBrackets =
        settings.value(key("format2Field4InBrackets"), defaults.format2Field4InBrackets).toBool();
    f.loaded = true;
}

void CVdShared::saveCompanyOutputFormats()
{
    const CompanyFormats& f = formats();
    QSettings settings;
    settings.setValue(key("format1Field1"), f.format1[0]);
    settings.setValue(key("format1Field2"), f.format1[1]);
    settings.setValue(key("format1Field3"), f.format1[2]);
    settings.setValue(key("format1Field2InBrackets"), f.format1Field2InBrackets);
    settings.setValue(key("format1Field3InBrackets"), f.format1Field3InBrackets);
    settings.setValue(key("format2Field1"), f.format2[0]);
    settings.setValue(key("format2Field2"), f.format2[1]);
    settings.setValue(key("format2Field3"), f.format2[2]);
    settings.setValue(key("format2Field4"), f.format2[3]);
    settings.setValue(key("format2Field3InBrackets"), f.format2Field3InBrackets);
    settings.setValue(key("format2Field4InBrackets"), f.format2Field4InBrackets);
}

void CVdShared::resetCompanyOutputFormat1()
{
    CompanyFormats& f = formats();
    const CompanyFormats defaults;
    std::copy(std::begin(defaults.format1), std::end(defaults.format1), std::begin(f.format1));
    f.format1Field2InBrackets = defaults.format1Field2InBrackets;
    f.format1Field3InBrackets = defaults.format1Field3InBrackets;
}

void CVdShared::resetCompanyOutputFormat2()
{
    CompanyFormats& f = formats();
    const CompanyFormats defaults;
    std::copy(std::begin(defaults.format2), std::end(defaults.format2), std::begin(f.format2));
    f.format2Field3InBrackets = defaults.format2Field3InBrackets;
    f.format2Field4InBrackets = defaults.format2Field4InBrackets;
}

int CVdShared::companyOutputFormat1FieldIdx1()
{
    return formats().format1[0];
}
int CVdShared::companyOutputFormat1FieldIdx2()
{
    return formats().format1[1];
}
int CVdShared::companyOutputFormat1FieldIdx3()
{
    return formats().format1[2];
}
bool CVdShared::companyOutputFormat1Field2InBrackets()
{
    return formats().format1Field2InBrackets;
}
bool CVdShared::companyOutputFormat1Field3InBrackets()
{
    return formats().format1Field3InBrackets;
}
int CVdShared::companyOutputFormat2FieldIdx1()
{
    return formats().format2[0];
}
int CVdShared::companyOutputFormat2FieldIdx2()
{
    return formats().format2[1];
}
int CVdShared::companyOutputFormat2FieldIdx3()
{
    return formats().format2[2];
}
int CVdShared::companyOutputFormat2FieldIdx4()
{
    return formats().format2[3];
}
bool CVdShared::companyOutputFormat2Field3InBrackets()
{
    return formats().format2Field3InBrackets;
}
bool CVdShared::companyOutputFormat2Field4InBrackets()
{
    return formats().format2Field4InBrackets;
}
void CVdShared::setCompanyOutputFormat1FieldIdx1(int index)
{
    formats().format1[0] = validIndex(index);
}
void CVdShared::setCompanyOutputFormat1FieldIdx2(int index)
{
    formats().format1[1] = validIndex(index);
}
void CVdShared::setCompanyOutputFormat1FieldIdx3(int index)
{
    formats().format1[2] = validIndex(index);
}
void CVdShared::setCompanyOutputFormat1Field2InBrackets(bool on)
{
    formats().format1Field2InBrackets = on;
}
void CVdShared::setCompanyOutputFormat1Field3InBrackets(bool on)
{
    formats().format1Field3InBrackets = on;
}
void CVdShared::setCompanyOutputFormat2FieldIdx1(int index)
{
    formats().format2[0] = validIndex(index);
}
void CVdShared::setCompanyOutputFormat2FieldIdx2(int index)
{
    formats().format2[1] = validIndex(index);
}
void CVdShared::setCompanyOutputFormat2FieldIdx3(int index)
{
    formats().format2[2] = validIndex(index);
}
void CVdShared::setCompanyOutputFormat2FieldIdx4(int index)
{
    formats().format2[3] = validIndex(index);
}
void CVdShared::setCompanyOutputFormat2Field3InBrackets(bool on)
{
    formats().format2Field3InBrackets = on;
}
void CVdShared::setCompanyOutputFormat2Field4InBrackets(bool on)
{
    formats().format2Field4InBrackets = on;
}

namespace {
QString outputFieldName(int index)
{
    return index == 0 ? QString() : CVdShared::getCompanyFieldByIndex(index);
}
} // namespace

QString CVdShared::getCompanyFormat1OutputFieldName1()
{
    return outputFieldName(formats().format1[0]);
}
QString CVdShared::getCompanyFormat1OutputFieldName2()
{
    return outputFieldName(formats().format1[1]);
}
QString CVdShared::getCompanyFormat1OutputFieldName3()
{
    return outputFieldName(formats().format1[2]);
}
QString CVdShared::getCompanyFormat2OutputFieldName1()
{
    return outputFieldName(formats().format2[0]);
}
QString CVdShared::getCompanyFormat2OutputFieldName2()
{
    return outputFieldName(formats().format2[1]);
}
QString CVdShared::getCompanyFormat2OutputFieldName3()
{
    return outputFieldName(formats().format2[2]);
}
QString CVdShared::getCompanyFormat2OutputFieldName4()
{
    return outputFieldName(formats().format2[3]);
}

QString CVdShared::getCompanyFormat1(const QAbstractItemModel* model, int row, const QString& separator)
{
    return format1(rowValues(model, row), separator);
}

QString CVdShared::getCompanyFormat2(const QAbstractItemModel* model, int row, const QString& separator)
{
    return format2(rowValues(model, row), separator);
}

QString CVdShared::getCompanyFormat1(const QString& company, const QString& lastname, const QString& type,
                                     const QString& separator)
{
    return format1(looseValues(company, lastname, type), separator);
}

QString CVdShared::getCompanyFormat2(const QString& company, const QString& lastname, const QString& type,
                                     const QString& separator)
{
    return format2(looseValues(company, lastname, type), separator);
}

QString CVdShared::getCompany4ReportFormat1(const QMap<QString, QString>& fields, bool withBracketedFields)
{
    return format1(fields, QStringLiteral(" "), withBracketedFields);
}

QString CVdShared::getCompany4ReportFormat2(const QMap<QString, QString>& fields, bool withBracketedFields)
{
    return format2(fields, QStringLiteral(" "), withBracketedFields);
}

QString CVdShared::formatCompany(const QList<int>& fieldIdx, bool lastButOneInBrackets, bool lastInBrackets,
                                 const QMap<QString, QString>& values, const QString& separator)
{
    // Empty text cells are stored as a single blank: a value of blanks only counts as empty.
    auto value = [&](int position) {
        const int index = fieldIdx.value(position, 0);
        return index <= 0 ? QString() : values.value(getCompanyFieldByIndex(index)).trimmed();
    };
    const int count = fieldIdx.size();
    if (count < 2)
        return value(0);
    const int bracketA = count - 2;
    const int bracketB = count - 1;

    QString text;
    for (int position = 0; position < bracketA; ++position) {
        const QString v = value(position);
        if (v.isEmpty())
            continue;
        if (!text.isEmpty())
            text += separator;
        text += v;
    }

    bool open = false;
    const QString a = value(bracketA);
    if (!a.isEmpty()) {
        if (!text.isEmpty())
            text += separator;
        if (lastButOneInBrackets) {
            text += QLatin1Char('(');
            open = true;
        }
        text += a;
        if (lastButOneInBrackets && !lastInBrackets) {
            text += QLatin1Char(')');
            open = false;
        }
    }

    const QString b = value(bracketB);
    if (!b.isEmpty()) {
        if (!text.isEmpty()) {
            const bool blank = separator == QLatin1String(" ") || separator == QLatin1String("  ");
            text += open && blank ? QLatin1Char(',') + separator : separator;
        }
        if (lastInBrackets && !open)
            text += QLatin1Char('(');
        text += b;
        if (lastInBrackets) {
            text += QLatin1Char(')');
            open = false;
        }
    }
    if (open)
        text += QLatin1Char(')');
    return text;
}

void CVdShared::check_sql_error(const QSqlError& error, const QString& className, const QString& functionName,
                                int line)
{
    if (!error.isValid() || error.type() == QSqlError::NoError)
        return;
    QString text = error.driverText();
    const QString database = error.databaseText();
    if (!database.isEmpty() && database != error.driverText())
        text += QLatin1Char('\n') + database;
    text += QLatin1Char('\n') + QCoreApplication::translate("CVdShared", "Class name: %1").arg(className);
    text +=
        QLatin1Char('\n') + QCoreApplication::translate("CVdShared", "Function name: %1").arg(functionName);
    text += QLatin1Char('\n') + QCoreApplication::translate("CVdShared", "Line: %1").arg(line);
    VDRPrompt::critical(QCoreApplication::translate("CVdShared", "SQL Error"), text);
}

QString CVdShared::firma_description(const QString& name, const QString& addition, bool newLine)
{
    if (addition.isEmpty())
        return name;
    return name + (newLine ? QStringLiteral("\n(") : QStringLiteral(" (")) + addition + QLatin1Char(')');
}

QString CVdShared::firma_description(const QString& name, const QString& addition1, const QString& addition2,
                                     bool newLine)
{
    QStringList additions;
    for (const QString& a : {addition1, addition2})
        if (!a.isEmpty())
            additions << a;
    return firma_description(name, additions.join(QStringLiteral(", ")), newLine);
}

QString CVdShared::clip_docnumber(const QString& fileName)
{
    const QFileInfo info(fileName);
    QString base = info.completeBaseName();
    const int cut = base.lastIndexOf(QLatin1Char('_'));
    if (cut >= 0)
        base.truncate(cut);
    return info.suffix().isEmpty() ? base : base + QLatin1Char('.') + info.suffix();
}

QStringList CVdShared::intlist2strlist(const QList<int>& list)
{
    QStringList out;
    for (int v : list)
        out << QString::number(v);
    return out;
}

QList<int> CVdShared::strlist2intlist(const QStringList& list)
{
    QList<int> out;
    for (const QString& s : list) {
        bool ok = false;
        const int v = s.trimmed().toInt(&ok);
        if (ok)
            out << v;
    }
    return out;
}

void CVdShared::set_busy_cursor()
{
    VDRPrompt::instance()->setBusy(true);
}

void CVdShared::restore_cursor()
{
    VDRPrompt::instance()->setBusy(false);
}

void CVdShared::idle()
{
    QCoreApplication::processEvents();
}
