#pragma once

#include <QSpinBox>

// The letter index of a report number: 0 shows as an empty text, 1 to 26 as "a" to "z".
class QSpinBoxLetter : public QSpinBox
{
    Q_OBJECT
public:
    explicit QSpinBoxLetter(QWidget* parent = nullptr);

protected:
    QString textFromValue(int value) const override;
    int valueFromText(const QString& text) const override;
    QValidator::State validate(QString& text, int& pos) const override;
};
