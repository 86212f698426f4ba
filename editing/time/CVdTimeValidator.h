#pragma once

#include <QValidator>

// Times typed as hours or hours:minutes; hours 0 to 23, minutes 0 to 59, nothing in between.
class CVdTimeValidator : public QValidator
{
    Q_OBJECT
public:
    explicit CVdTimeValidator(QObject* parent = nullptr) : QValidator(parent) {}
    State validate(QString& input, int& pos) const override;
    // Hours and minutes of an acceptable, non-empty text; false otherwise.
    static bool parse(const QString& text, int* hours, int* minutes);
};
