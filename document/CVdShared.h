#pragma once

#include <QList>
#include <QMap>
#include <QSqlError>
#include <QString>
#include <QStringList>

class QAbstractItemModel;

// Small helpers used across the program.
class CVdShared
{
public:
    // The text of an SQL failure as a user should see it: SQLite's own message ("database disk
    // image is malformed") rather than Qt's generic "Unable to execute statement".
    static QString sqlErrorText(const QSqlError& error)
    {
        const QString database = error.databaseText().trimmed();
        return database.isEmpty() ? error.driverText() : database;
    }

    // ---- Company output formats ----
    // The one place that turns a company into one line of text: combo boxes, the form, printouts,
    // exports and the command-line tool all go through these functions.

    // Index of a company field -> column of table company; index 0 is "empty" (nothing).
    static const QStringList& listIdx2CompanyField();
    static int companyFieldCount() { return listIdx2CompanyField().size(); }
    // "" for an index out of range.
    static QString getCompanyFieldByIndex(int index);
    // -1 for a name that is not a company field.
    static int getListIdxByCompanyField(const QString& field);

    // The settings group shared by all diaries, and its keys.
    static QString companyOutputFormatsGroup() { return QStringLiteral("CompanyOutputFormats"); }
    // Reads the formats from the settings (defaults where a key is missing or out of range).
    static void restoreCompanyOutputFormats();
    static void saveCompanyOutputFormats();
    static void resetCompanyOutputFormat1();
    static void resetCompanyOutputFormat2();

    static int companyOutputFormat1FieldIdx1();
    static int companyOutputFormat1FieldIdx2();
    static int companyOutputFormat1FieldIdx3();
    static bool companyOutputFormat1Field2InBrackets();
    static bool companyOutputFormat1Field3InBrackets();
    static int companyOutputFormat2FieldIdx1();
    static int companyOutputFormat2FieldIdx2();
    static int companyOutputFormat2FieldIdx3();
    static int companyOutputFormat2FieldIdx4();
    static bool companyOutputFormat2Field3InBrackets();
    static bool companyOutputFormat2Field4InBrackets();
    static void setCompanyOutputFormat1FieldIdx1(int index);
    static void setCompanyOutputFormat1FieldIdx2(int index);
    static void setCompanyOutputFormat1FieldIdx3(int index);
    static void setCompanyOutputFormat1Field2InBrackets(bool on);
    static void setCompanyOutputFormat1Field3InBrackets(bool on);
    static void setCompanyOutputFormat2FieldIdx1(int index);
    static void setCompanyOutputFormat2FieldIdx2(int index);
    static void setCompanyOutputFormat2FieldIdx3(int index);
    static void setCompanyOutputFormat2FieldIdx4(int index);
    static void setCompanyOutputFormat2Field3InBrackets(bool on);
    static void setCompanyOutputFormat2Field4InBrackets(bool on);

    // Column name of each position ("" for an empty position).
    static QString getCompanyFormat1OutputFieldName1();
    static QString getCompanyFormat1OutputFieldName2();
    static QString getCompanyFormat1OutputFieldName3();
    static QString getCompanyFormat2OutputFieldName1();
    static QString getCompanyFormat2OutputFieldName2();
    static QString getCompanyFormat2OutputFieldName3();
    static QString getCompanyFormat2OutputFieldName4();

    // Format 1 (company) and format 2 (person) of a company row; "" for a missing model or a row
    // out of range.
    static QString getCompanyFormat1(const QAbstractItemModel* model, int row, const QString& separator);
    static QString getCompanyFormat2(const QAbstractItemModel* model, int row, const QString& separator);
    // The same from loose values; other fields count as empty.
    static QString getCompanyFormat1(const QString& company, const QString& lastname, const QString& type,
                                     const QString& separator);
    static QString getCompanyFormat2(const QString& company, const QString& lastname, const QString& type,
                                     const QString& separator);
    // From a map of field name to value, separated by blanks; without the bracketed positions
    // when withBracketedFields is false.
    static QString getCompany4ReportFormat1(const QMap<QString, QString>& fields, bool withBracketedFields);
    static QString getCompany4ReportFormat2(const QMap<QString, QString>& fields, bool withBracketedFields);

    // The rule behind all of the above: 'fieldIdx' holds the positions; the last two may be
    // bracketed. Plain positions before them are joined with the separator. Empty values (blanks
    // only) are left out together with their separator and brackets.
    static QString formatCompany(const QList<int>& fieldIdx, bool lastButOneInBrackets, bool lastInBrackets,
                                 const QMap<QString, QString>& values, const QString& separator);

    // ---- Printing helpers ----

    // Shows a failed query (driver text, database text, where it happened) through the prompt;
    // silent for no error.
    static void check_sql_error(const QSqlError& error, const QString& className, const QString& functionName,
                                int line);
    // "name (addition)", on two lines when newLine is set; the name alone for an empty addition.
    static QString firma_description(const QString& name, const QString& addition, bool newLine);
    static QString firma_description(const QString& name, const QString& addition1, const QString& addition2,
                                     bool newLine);
    // A document's file name without its trailing "_..." part of the base name, keeping the suffix.
    static QString clip_docnumber(const QString& fileName);
    static QStringList intlist2strlist(const QList<int>& list);
    // Entries that are not numbers are left out.
    static QList<int> strlist2intlist(const QStringList& list);
    // Busy cursor through the prompt, kept until restore_cursor.
    static void set_busy_cursor();
    static void restore_cursor();
    // Lets pending events run (repaints, the printer's spooling).
    static void idle();
};
