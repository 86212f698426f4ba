#pragma once

#include <QString>

class QWidget;
class VDRCompleterLineEdit;
class VDRCompleterTextEdit;
class VDRSpellChecker;

// The suggestion fields the report form and the sub-table delegates build, with their lists.
class VDRCompleterFactory
{
public:
    static VDRCompleterLineEdit* createEditorLine(QWidget* parent, int regIdx, const QString& title,
                                                  int tableID, const QString& column, int columnID);
    // 'checker' may be null: then nothing is underlined.
    static VDRCompleterTextEdit* createSpellCheckEditorText(QWidget* parent, int regIdx, const QString& title,
                                                            int tableID, const QString& column, int columnID,
                                                            VDRSpellChecker* checker);
};
