#include "document/VDREntryNumber.h"

#include <QSqlQuery>
#include <QVariant>

#include <algorithm>
#include <climits>

VDREntryNumber::VDREntryNumber(const QString& text, const QString& userId) : m_text(text), m_userId(userId)
{
    int digits = 0;
    // digitValue also reads non-Latin decimal digits, which QString::toInt does not.
    qint64 value = 0;
    for (; digits < text.size() && text.at(digits).isDigit(); ++digits) {
        if (value <= INT_MAX)
            value = value * 10 + text.at(digits).digitValue();
    }
    if (digits == 0)
        return;
    m_digits = digits;
    m_number = static_cast<int>(std::min<qint64>(value, INT_MAX));
    if (digits < text.size() && text.at(digits) != QLatin1Char(' ') && text.at(digits) != QLatin1Char('('))
        m_letter = text.at(digits);
}

VDREntryNumber VDREntryNumber::forComparing(const QString& text)
{
    return VDREntryNumber(VDREntryNumber(text.trimmed()).withoutDraft());
}

int VDREntryNumber::letterIndex() const
{
    const ushort c = m_letter.unicode();
    if (c >= 'a' && c <= 'z')
        return c - 'a' + 1;
    if (c >= 'A' && c <= 'Z')
        return c - 'A' + 1;
    return 0;
}

QString VDREntryNumber::withoutDraft() const
{
    if (m_digits < 0) {
        // Not a number of ours: cutting after "digits and letter" would leave one character, so
        // only the draft suffix goes.
        return isDraft() ? m_text.left(m_text.size() - draftSuffix().size()) : m_text;
    }
    int end = m_digits;
    if (end < m_text.size() && !m_text.at(end).isSpace() && m_text.at(end) != QLatin1Char('('))
        ++end; // the letter of an inserted report
    return m_text.left(end);
}

QString VDREntryNumber::withUserId() const
{
    if (m_userId.isEmpty())
        return m_text;
    const int bracket = m_text.indexOf(QLatin1Char('('));
    if (bracket < 0)
        return m_text + QLatin1Char('-') + m_userId;
    // The id goes before the blank that precedes "(".
    int insertAt = bracket;
    if (insertAt > 0 && m_text.at(insertAt - 1) == QLatin1Char(' '))
        --insertAt;
    return m_text.left(insertAt) + QLatin1Char('-') + m_userId + m_text.mid(insertAt);
}

int VDREntryNumber::compare(const VDREntryNumber& other) const
{
    if (m_number != other.m_number)
        return m_number < other.m_number ? -1 : 1;
    if (m_letter != other.m_letter)
        return m_letter < other.m_letter ? -1 : 1;
    return 0;
}

QString VDREntryNumber::padded(int number, int digits)
{
    return QString::number(number).rightJustified(digits, QLatin1Char('0'));
}

QString VDREntryNumber::compose(const QString& number, const QString& userId, bool draft)
{
    QString result = number;
    if (!userId.isEmpty())
        result += QLatin1Char('-') + userId;
    if (draft)
        result += draftSuffix();
    return result;
}

bool VDREntryNumber::sameNumber(const QString& a, const QString& b)
{
    const int width = std::max(a.size(), b.size());
    return a.rightJustified(width, QLatin1Char('0'))
               .compare(b.rightJustified(width, QLatin1Char('0')), Qt::CaseInsensitive) == 0;
}

int VDREntryNumber::highestNumber(QSqlQuery& query)
{
    int result = 0;
    while (query.next())
        result = std::max(result, VDREntryNumber(query.value(0).toString()).number());
    return result;
}

int VDREntryNumber::highestNumber(const QSqlDatabase& db)
{
    QSqlQuery q(db);
    return q.exec(QStringLiteral("SELECT number FROM entry")) ? highestNumber(q) : 0;
}
