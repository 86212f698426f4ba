#pragma once

#include <QModelIndex>
#include <QPointer>
#include <QTextCharFormat>
#include <QTextListFormat>
#include <QWidget>

class QToolButton;
class VDRCompleter;
class VDRCompleterTextEdit;
class VDRSpellChecker;
class VDRSqlTableModel;

// A formatted text field (stored as HTML) with its formatting toolbar. The editor inside carries
// the "html" property the form's mapper binds to.
class VDRRichTextEdit : public QWidget
{
    Q_OBJECT
public:
    explicit VDRRichTextEdit(QWidget* parent = nullptr, VDRSpellChecker* checker = nullptr);

    QString html() const;
    void setHtml(const QString& html);
    VDRCompleterTextEdit* textEdit() const { return m_edit; }
    void setCompleter(VDRCompleter* completer);

    // The cell the text belongs to and the number the suggestions and the enlarged editor use.
    void setCell(VDRSqlTableModel* model, const QModelIndex& index, const QString& column);
    VDRSqlTableModel* cellModel() const { return m_model; }
    QModelIndex cellIndex() const { return m_index; }
    QString cellColumn() const { return m_column; }
    void setFieldNumber(int number) { m_fieldNumber = number; }
    int fieldNumber() const { return m_fieldNumber; }
    void setReadOnly(bool readOnly);

    QToolButton* button(const QString& objectName) const;

signals:
    void textChanged();
    // The enlarge button: the form opens the enlarged editor.
    void enlargeRequested(VDRRichTextEdit* edit);

private slots:
    void slotCursorFormatChanged();
    void slotSelectionChanged();
    void slotBold(bool on);
    void slotItalic(bool on);
    void slotUnderline(bool on);
    void slotStrikeOut(bool on);
    void slotForegroundColor();
    void slotMarker();
    void slotCopyFormat();
    void slotList(QTextListFormat::Style style);
    void slotIndent(int delta);

private:
    QToolButton* addButton(const QString& objectName, const QString& tip, const QString& text,
                           bool checkable);
    void mergeFormat(const QTextCharFormat& format);

    VDRCompleterTextEdit* m_edit;
    QList<QToolButton*> m_buttons;
    QPointer<VDRSqlTableModel> m_model;
    QModelIndex m_index;
    QString m_column;
    int m_fieldNumber = -1;
    bool m_copyFormatArmed = false;
    QTextCharFormat m_copiedFormat;
};
