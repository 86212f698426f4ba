#pragma once

#include <QDialog>
#include <QModelIndex>
#include <QPointer>

class VDRRichTextEdit;
class VDRSqlTableModel;

// The enlarged editor of a formatted text field, in a larger font.
class VDRRichTextEditDialog : public QDialog
{
    Q_OBJECT
public:
    VDRRichTextEditDialog(VDRSqlTableModel* model, const QString& column, const QModelIndex& index,
                          int fieldNumber, QWidget* parent = nullptr);

    static QString titleFor(int fieldNumber);
    // The text as the dialog shows it, and as it goes back into the form.
    static QString enlarged(QString html);
    static QString normal(QString html);

    void setText(const QString& html);
    QString text() const;
    VDRRichTextEdit* editor() const { return m_edit; }

private:
    VDRRichTextEdit* m_edit;
};
