#pragma once

#include <QTextEdit>

class QToolButton;
class VDRCompleter;
class VDRSpellChecker;

// A multi-line plain-text field with a suggestion list and, given a checker, misspelt words
// underlined. Offers the list for the current paragraph up to the cursor; a chosen entry
// replaces that part, line breaks included.
class VDRCompleterTextEdit : public QTextEdit
{
    Q_OBJECT
    // Stored texts come in through here (the form's mapper writes this property).
    Q_PROPERTY(QString html READ toHtml WRITE setStoredHtml NOTIFY textChanged USER true)
public:
    explicit VDRCompleterTextEdit(QWidget* parent = nullptr, VDRSpellChecker* checker = nullptr);

    // Like setHtml, but pictures the text names on this computer are not read (only those it
    // carries itself are shown).
    void setStoredHtml(const QString& html);

    // Takes over the list; an earlier own list is deleted.
    void setCompleter(VDRCompleter* completer);
    VDRCompleter* completer() const { return m_completer; }
    // Switches suggestions and the button off for this field only.
    void enableCompleter(bool enable);
    // Underlines misspelt words from now on; a field has at most one checker.
    void setSpellChecker(VDRSpellChecker* checker);
    // The current paragraph up to the cursor, trimmed: what the list is matched against.
    QString textUnderCursor() const;
    // Learns the whole text; the editor that owns the field calls this when it commits.
    void learnText();
    QToolButton* listButton() const { return m_button; }

protected:
    void keyPressEvent(QKeyEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

private slots:
    void slotChosen(const QString& display);
    void slotListButton();

private:
    void updateButton();

    VDRCompleter* m_completer = nullptr;
    QToolButton* m_button;
    bool m_enabled = true;
};
