#pragma once

#include <QFont>
#include <QString>

// One styled run of text in a table cell; a cell is a QList<CText>.
class CText
{
public:
    CText(const QString& text = QString()) : text(text) {}
    CText(const QString& text, const QFont& font) : text(text), font(font), hasFont(true) {}
    CText(const CText& other) = default;
    CText& operator=(const CText& other) = default;

    QString text;
    QFont font;
    bool hasFont = false;
};
