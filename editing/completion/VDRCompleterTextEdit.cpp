#include "editing/completion/VDRCompleterTextEdit.h"

#include "document/VDRRichTextResources.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRSpellChecker.h"

#include <QAbstractItemView>
#include <QKeyEvent>
#include <QRegularExpression>
#include <QSyntaxHighlighter>
#include <QToolButton>

namespace {
class SpellHighlighter : public QSyntaxHighlighter
{
public:
    SpellHighlighter(QTextDocument* document, VDRSpellChecker* checker)
        : QSyntaxHighlighter(document), m_checker(checker)
    {
        m_format.setUnderlineStyle(QTextCharFormat::SpellCheckUnderline);
        m_format.setUnderlineColor(Qt::red);
    }

protected:
    void highlightBlock(const QString& text) override
    {
        if (!m_checker->isActive())
            return;
        static const QRegularExpression word(QStringLiteral("[\\p{L}\\p{M}]+"));
        auto it = word.globalMatch(text);
        while (it.hasNext()) {
            const QRegularExpressionMatch match = it.next();
            if (!m_checker->isCorrect(match.captured()))
                setFormat(match.capturedStart(), match.capturedLength(), m_format);
        }
    }

private:
    VDRSpellChecker* m_checker;
    QTextCharFormat m_format;
};
} // namespace

VDRCompleterTextEdit::VDRCompleterTextEdit(QWidget* parent, VDRSpellChecker* checker)
    : QTextEdit(parent), m_button(new QToolButton(this))
{
    setAcceptRichText(false);
    setSpellChecker(checker);
    m_button->setObjectName(QStringLiteral("completerButton"));
    m_button->setArrowType(Qt::DownArrow);
    m_button->setToolTip(tr("Autotexte"));
    m_button->setFocusPolicy(Qt::NoFocus);
    connect(m_button, &QToolButton::clicked, this, &VDRCompleterTextEdit::slotListButton);
    updateButton();
}

void VDRCompleterTextEdit::setCompleter(VDRCompleter* completer)
{
    if (m_completer == completer)
        return;
    if (m_completer && m_completer->parent() == this)
        delete m_completer;
    m_completer = completer;
    if (m_completer) {
        m_completer->setParent(this);
        m_completer->setWidget(this);
        connect(m_completer, QOverload<const QString&>::of(&QCompleter::activated), this,
                &VDRCompleterTextEdit::slotChosen);
    }
    updateButton();
}

void VDRCompleterTextEdit::enableCompleter(bool enable)
{
    m_enabled = enable;
    if (!enable && m_completer)
        m_completer->popup()->hide();
    updateButton();
}

QString VDRCompleterTextEdit::textUnderCursor() const
{
    QTextCursor cursor = textCursor();
    cursor.movePosition(QTextCursor::StartOfBlock, QTextCursor::KeepAnchor);
    return cursor.selectedText().trimmed();
}

void VDRCompleterTextEdit::learnText()
{
    if (m_completer && m_enabled)
        m_completer->appendEntry(toPlainText());
}

void VDRCompleterTextEdit::keyPressEvent(QKeyEvent* event)
{
    if (!m_completer || !m_enabled) {
        QTextEdit::keyPressEvent(event);
        return;
    }
    if (m_completer->popupTakesKey(event)) {
        event->ignore();
        return;
    }
    const bool ctrlE = event->key() == Qt::Key_E && (event->modifiers() & Qt::ControlModifier);
    if (!ctrlE)
        QTextEdit::keyPressEvent(event);
    m_completer->offer(event, textUnderCursor(), cursorRect());
}

void VDRCompleterTextEdit::resizeEvent(QResizeEvent* event)
{
    QTextEdit::resizeEvent(event);
    updateButton();
}

void VDRCompleterTextEdit::slotChosen(const QString& display)
{
    QTextCursor cursor = textCursor();
    cursor.movePosition(QTextCursor::StartOfBlock, QTextCursor::KeepAnchor);
    cursor.insertText(m_completer->getMultiLineEntry(display));
    setTextCursor(cursor);
}

void VDRCompleterTextEdit::slotListButton()
{
    if (!m_completer)
        return;
    setFocus();
    m_completer->showAll(cursorRect());
}

void VDRCompleterTextEdit::updateButton()
{
    const bool shown = m_completer && m_enabled;
    m_button->setVisible(shown);
    const int side = 18;
    m_button->setGeometry(width() - side - frameWidth(), frameWidth(), side, side);
    setViewportMargins(0, 0, shown ? side : 0, 0);
}

void VDRCompleterTextEdit::setSpellChecker(VDRSpellChecker* checker)
{
    // A field built before the checker existed gets its underlining later.
    if (!checker || document()->findChild<SpellHighlighter*>())
        return;
    new SpellHighlighter(document(), checker);
}

void VDRCompleterTextEdit::setStoredHtml(const QString& html)
{
    VDRRichTextResources::guard(document(), html);
    setHtml(html);
}
