#pragma once

#include <QChar>
#include <QSqlDatabase>
#include <QString>

class QSqlQuery;

// A report number as the diary stores it: zero-padded digits (3 to 5), the letter of a report
// inserted between two others, " (Entwurf)" while the report is not locked ("012a (Entwurf)");
// shown with its author's user id as "012a-AB (Entwurf)". Decimal digits of any script count.
// Texts that do not start with a digit (typed or imported) have no number and keep their text.
class VDREntryNumber
{
public:
    VDREntryNumber() = default;
    explicit VDREntryNumber(const QString& text, const QString& userId = QString());
    // Blanks around the text and white space after the digits are no letter: for comparing numbers
    // that come from outside with those of the diary.
    static VDREntryNumber forComparing(const QString& text);

    static QString draftSuffix() { return QStringLiteral(" (Entwurf)"); }

    const QString& text() const { return m_text; }
    const QString& userId() const { return m_userId; }
    // How many digits the text starts with; -1 for none.
    int digits() const { return m_digits; }
    // The value of the leading digits, at most INT_MAX; 0 without digits.
    int number() const { return m_number; }
    // The character after the digits unless that is a blank or "("; QChar(0) for none.
    QChar letter() const { return m_letter; }
    // 1 for "a" or "A" to 26 for "z" or "Z"; 0 for no letter or another character.
    int letterIndex() const;
    bool isDraft() const { return m_text.endsWith(draftSuffix()); }

    // The number as a locked report shows it: "012a (Entwurf)" -> "012a". Unlike letter(), it also
    // ends at white space other than a blank right after the digits.
    QString withoutDraft() const;
    // "012 (Entwurf)" -> "012-AB (Entwurf)", "012" -> "012-AB"; the text itself without a user id.
    QString withUserId() const;

    // By number, then letter.
    int compare(const VDREntryNumber& other) const;
    bool operator<(const VDREntryNumber& other) const { return compare(other) < 0; }

    static QString padded(int number, int digits);
    // "012a", "AB", true -> "012a-AB (Entwurf)".
    static QString compose(const QString& number, const QString& userId, bool draft);
    // The number of a new report: "013 (Entwurf)".
    static QString newDraft(int number, int digits) { return compose(padded(number, digits), {}, true); }
    // "12a" of a predecessor diary is "012a" here; letters in either case.
    static bool sameNumber(const QString& a, const QString& b);

    // The highest number in the first column of the rows an executed query has still to give.
    static int highestNumber(QSqlQuery& query);
    // The highest number of a diary's reports; 0 when it cannot be read.
    static int highestNumber(const QSqlDatabase& db);

private:
    QString m_text;
    QString m_userId;
    int m_digits = -1;
    int m_number = 0;
    QChar m_letter = QChar(0);
};
