#include "editing/time/CVdTimeValidator.h"

namespace {
bool digitsOnly(const QString& text)
{
    for (const QChar c : text) {
        if (c < QLatin1Char('0') || c > QLatin1Char('9'))
            return false;
    }
    return true;
}
} // namespace

bool CVdTimeValidator::parse(const QString& text, int* hours, int* minutes)
{
    const int colon = text.indexOf(QLatin1Char(':'));
    const QString hourPart = colon < 0 ? text : text.left(colon);
    const QString minutePart = colon < 0 ? QString() : text.mid(colon + 1);
    // Three digits are enough for any valid value and keep toInt from overflowing.
    if (hourPart.isEmpty() || hourPart.size() > 3 || !digitsOnly(hourPart) || minutePart.size() > 3 ||
        !digitsOnly(minutePart))
        return false;
    const int h = hourPart.toInt();
    const int m = minutePart.isEmpty() ? 0 : minutePart.toInt();
    if (h >= 24 || m > 59)
        return false;
    if (hours)
        *hours = h;
    if (minutes)
        *minutes = m;
    return true;
}

QValidator::State CVdTimeValidator::validate(QString& input, int& pos) const
{
    Q_UNUSED(pos)
    if (input.isEmpty())
        return Acceptable;
    return parse(input, nullptr, nullptr) ? Acceptable : Invalid;
}
