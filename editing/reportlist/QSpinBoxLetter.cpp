#include "editing/reportlist/QSpinBoxLetter.h"

QSpinBoxLetter::QSpinBoxLetter(QWidget* parent) : QSpinBox(parent)
{
    setRange(0, 26);
}

QString QSpinBoxLetter::textFromValue(int value) const
{
    return value >= 1 && value <= 26 ? QString(QChar(value + 96)) : QString();
}

int QSpinBoxLetter::valueFromText(const QString& text) const
{
    const QString t = text.trimmed();
    if (t.isEmpty())
        return 0;
    // An upper-case letter means the same index; the number itself always shows it in lower case.
    const int value = t.at(0).toLower().unicode() - 96;
    return value >= 1 && value <= 26 ? value : 0;
}

QValidator::State QSpinBoxLetter::validate(QString& text, int& pos) const
{
    Q_UNUSED(pos)
    const QString t = text.trimmed();
    if (t.isEmpty())
        return QValidator::Acceptable;
    // One letter only: "ab" or "7" would silently become another index.
    if (t.size() != 1)
        return QValidator::Invalid;
    const ushort c = t.at(0).toLower().unicode();
    return c >= 'a' && c <= 'z' ? QValidator::Acceptable : QValidator::Invalid;
}
