#include "editing/completion/VDRCompleterFactory.h"

#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRCompleterLineEdit.h"
#include "editing/completion/VDRCompleterTextEdit.h"
#include "editing/form/VDRRegisterNames.h"

VDRCompleterLineEdit* VDRCompleterFactory::createEditorLine(QWidget* parent, int regIdx, const QString& title,
                                                            int tableID, const QString& column, int columnID)
{
    // The workforce list belongs to the persons register whichever delegate builds it.
    if (title == QLatin1String("Bau-Besetzung"))
        regIdx = VDRRegisterNames::Anwesende;
    auto* edit = new VDRCompleterLineEdit(parent);
    edit->setCompleterData(regIdx, title, tableID, column, columnID);
    edit->createCompleter();
    return edit;
}

VDRCompleterTextEdit* VDRCompleterFactory::createSpellCheckEditorText(QWidget* parent, int regIdx,
                                                                      const QString& title, int tableID,
                                                                      const QString& column, int columnID,
                                                                      VDRSpellChecker* checker)
{
    auto* edit = new VDRCompleterTextEdit(parent, checker);
    edit->setCompleter(new VDRCompleter(regIdx, title, tableID, column, columnID, edit));
    return edit;
}
