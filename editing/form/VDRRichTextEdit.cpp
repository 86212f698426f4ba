#include "editing/form/VDRRichTextEdit.h"

#include "document/VDRSqlTableModel.h"
#include "editing/completion/VDRCompleterTextEdit.h"

#include <QColorDialog>
#include <QGuiApplication>
#include <QHBoxLayout>
#include <QTextBlock>
#include <QTextCursor>
#include <QTextList>
#include <QToolButton>
#include <QVBoxLayout>

namespace {
const QString kMarkerOn =
    QStringLiteral(":/VDRMainWindow/Resources/RichTextEditor/RichTextEditor-markieren.ico");
const QString kMarkerOff =
    QStringLiteral(":/VDRMainWindow/Resources/RichTextEditor/RichTextEditor-markieren-aus.ico");
const QColor kMarkerColor(255, 255, 0);
} // namespace

VDRRichTextEdit::VDRRichTextEdit(QWidget* parent, VDRSpellChecker* checker)
    : QWidget(parent), m_edit(new VDRCompleterTextEdit(this, checker))
{
    m_edit->setObjectName(QStringLiteral("richTextEdit"));
    m_edit->setAcceptRichText(true);
    auto* bar = new QHBoxLayout;
    bar->setContentsMargins(0, 0, 0, 0);
    bar->setSpacing(1);
    auto add = [&](const char* name, const QString& tip, const QString& text, bool checkable) {
        QToolButton* b = addButton(QLatin1String(name), tip, text, checkable);
        bar->addWidget(b);
        return b;
    };
    connect(add("btnBold", tr("Fett"), QStringLiteral("F"), true), &QToolButton::clicked, this,
            &VDRRichTextEdit::slotBold);
    connect(add("btnItalic", tr("Kursiv"), QStringLiteral("K"), true), &QToolButton::clicked, this,
            &VDRRichTextEdit::slotItalic);
    connect(add("btnUnderline", tr("Unterstrichen"), QStringLiteral("U"), true), &QToolButton::clicked, this,
            &VDRRichTextEdit::slotUnderline);
    connect(add("btnStrikeOut", tr("Durchgestrichen"), QStringLiteral("S"), true), &QToolButton::clicked,
            this, &VDRRichTextEdit::slotStrikeOut);
    connect(add("btnForegroundColor", tr("Textfarbe"), QStringLiteral("A"), false), &QToolButton::clicked,
            this, &VDRRichTextEdit::slotForegroundColor);
    QToolButton* marker = add("btnMarker", tr("Text markieren"), QStringLiteral("M"), false);
    marker->setIcon(QIcon(kMarkerOn));
    connect(marker, &QToolButton::clicked, this, &VDRRichTextEdit::slotMarker);
    connect(add("btnCopyFormat", tr("Format übertragen"), QStringLiteral("P"), true), &QToolButton::clicked,
            this, &VDRRichTextEdit::slotCopyFormat);
    connect(add("btnListBullet", tr("Aufzählung"), QStringLiteral("•"), false), &QToolButton::clicked, this,
            [this] { slotList(QTextListFormat::ListDisc); });
    connect(add("btnListSquare", tr("Aufzählung"), QStringLiteral("▪"), false), &QToolButton::clicked, this,
            [this] { slotList(QTextListFormat::ListSquare); });
    connect(add("btnListNum", tr("Nummerierung"), QStringLiteral("1."), false), &QToolButton::clicked, this,
            [this] { slotList(QTextListFormat::ListDecimal); });
    connect(add("btnListAbc", tr("Alphabetisch"), QStringLiteral("a."), false), &QToolButton::clicked, this,
            [this] { slotList(QTextListFormat::ListLowerAlpha); });
    connect(add("btnDecreaseIndent", tr("Einzug verkleinern"), QStringLiteral("⇤"), false),
            &QToolButton::clicked, this, [this] { slotIndent(-1); });
    connect(add("btnIncreaseIndent", tr("Einzug vergrößern"), QStringLiteral("⇥"), false),
            &QToolButton::clicked, this, [this] { slotIndent(1); });
    bar->addStretch();
    QToolButton* enlarge = add("btnEnlarge", tr("Vergrößern"), QStringLiteral("⤢"), false);
    connect(enlarge, &QToolButton::clicked, this, [this] { emit enlargeRequested(this); });

    auto* layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(1);
    layout->addLayout(bar);
    layout->addWidget(m_edit);
    connect(m_edit, &QTextEdit::textChanged, this, &VDRRichTextEdit::textChanged);
    connect(m_edit, &QTextEdit::currentCharFormatChanged, this, &VDRRichTextEdit::slotCursorFormatChanged);
    connect(m_edit, &QTextEdit::selectionChanged, this, &VDRRichTextEdit::slotSelectionChanged);
}

QToolButton* VDRRichTextEdit::addButton(const QString& objectName, const QString& tip, const QString& text,
                                        bool checkable)
{
    auto* b = new QToolButton(this);
    b->setObjectName(objectName);
    b->setToolTip(tip);
    b->setText(text);
    b->setCheckable(checkable);
    b->setAutoRaise(true);
    b->setFocusPolicy(Qt::NoFocus);
    m_buttons.append(b);
    return b;
}

QToolButton* VDRRichTextEdit::button(const QString& objectName) const
{
    for (QToolButton* b : m_buttons)
        if (b->objectName() == objectName)
            return b;
    return nullptr;
}

QString VDRRichTextEdit::html() const
{
    return m_edit->toHtml();
}

void VDRRichTextEdit::setHtml(const QString& html)
{
    m_edit->setStoredHtml(html);
}

void VDRRichTextEdit::setCompleter(VDRCompleter* completer)
{
    m_edit->setCompleter(completer);
}

void VDRRichTextEdit::setCell(VDRSqlTableModel* model, const QModelIndex& index, const QString& column)
{
    m_model = model;
    m_index = index;
    m_column = column;
}

void VDRRichTextEdit::setReadOnly(bool readOnly)
{
    m_edit->setReadOnly(readOnly);
    for (QToolButton* b : qAsConst(m_buttons))
        if (b->objectName() != QLatin1String("btnEnlarge"))
            b->setEnabled(!readOnly);
}

void VDRRichTextEdit::mergeFormat(const QTextCharFormat& format)
{
    // Without a selection the format applies to what is typed next.
    QTextCursor cursor = m_edit->textCursor();
    cursor.mergeCharFormat(format);
    m_edit->mergeCurrentCharFormat(format);
}

void VDRRichTextEdit::slotBold(bool on)
{
    QTextCharFormat f;
    f.setFontWeight(on ? QFont::Bold : QFont::Normal);
    mergeFormat(f);
}

void VDRRichTextEdit::slotItalic(bool on)
{
    QTextCharFormat f;
    f.setFontItalic(on);
    mergeFormat(f);
}

void VDRRichTextEdit::slotUnderline(bool on)
{
    QTextCharFormat f;
    f.setFontUnderline(on);
    mergeFormat(f);
}

void VDRRichTextEdit::slotStrikeOut(bool on)
{
    QTextCharFormat f;
    f.setFontStrikeOut(on);
    mergeFormat(f);
}

void VDRRichTextEdit::slotForegroundColor()
{
    const QColor color = QColorDialog::getColor(m_edit->textColor(), this, tr("Textfarbe"));
    if (!color.isValid())
        return;
    QTextCharFormat f;
    f.setForeground(color);
    mergeFormat(f);
}

void VDRRichTextEdit::slotMarker()
{
    QTextCharFormat f;
    if (m_edit->currentCharFormat().background().style() != Qt::NoBrush)
        f.setBackground(Qt::NoBrush);
    else
        f.setBackground(kMarkerColor);
    mergeFormat(f);
    slotCursorFormatChanged();
}

void VDRRichTextEdit::slotCopyFormat()
{
    m_copiedFormat = m_edit->currentCharFormat();
    m_copyFormatArmed = true;
}

void VDRRichTextEdit::slotSelectionChanged()
{
    // The copied format goes onto the next selection made with the mouse.
    if (!m_copyFormatArmed || !m_edit->textCursor().hasSelection() ||
        !(QGuiApplication::mouseButtons() & Qt::LeftButton))
        return;
    m_copyFormatArmed = false;
    m_edit->textCursor().setCharFormat(m_copiedFormat);
    if (QToolButton* b = button(QStringLiteral("btnCopyFormat")))
        b->setChecked(false);
}

void VDRRichTextEdit::slotList(QTextListFormat::Style style)
{
    QTextCursor cursor = m_edit->textCursor();
    cursor.beginEditBlock();
    if (QTextList* list = cursor.currentList(); list && list->format().style() == style) {
        // The same button again ends the list for this paragraph.
        list->remove(cursor.block());
        QTextBlockFormat block = cursor.blockFormat();
        block.setIndent(0);
        cursor.setBlockFormat(block);
    } else {
        QTextListFormat format;
        format.setStyle(style);
        format.setIndent(qMax(1, cursor.blockFormat().indent() + 1));
        cursor.createList(format);
    }
    cursor.endEditBlock();
}

void VDRRichTextEdit::slotIndent(int delta)
{
    QTextCursor cursor = m_edit->textCursor();
    if (QTextList* list = cursor.currentList()) {
        QTextListFormat format = list->format();
        format.setIndent(qMax(1, format.indent() + delta));
        list->setFormat(format);
        return;
    }
    QTextBlockFormat block = cursor.blockFormat();
    block.setIndent(qMax(0, block.indent() + delta));
    cursor.setBlockFormat(block);
}

void VDRRichTextEdit::slotCursorFormatChanged()
{
    const QTextCharFormat f = m_edit->currentCharFormat();
    auto check = [this](const char* name, bool on) {
        if (QToolButton* b = button(QLatin1String(name)))
            b->setChecked(on);
    };
    check("btnBold", f.fontWeight() >= QFont::Bold);
    check("btnItalic", f.fontItalic());
    check("btnUnderline", f.fontUnderline());
    check("btnStrikeOut", f.fontStrikeOut());
    if (QToolButton* b = button(QStringLiteral("btnMarker")))
        b->setIcon(QIcon(f.background().style() != Qt::NoBrush ? kMarkerOff : kMarkerOn));
}
