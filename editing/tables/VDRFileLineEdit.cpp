#include "editing/tables/VDRFileLineEdit.h"

#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"

#include <QCompleter>
#include <QPointer>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QToolButton>

VDRFileLineEdit::VDRFileLineEdit(int mode, QWidget* parent)
    : QLineEdit(parent), m_mode(mode), m_button(new QToolButton(this))
{
    m_button->setText(QStringLiteral("…"));
    m_button->setToolTip(tr("Dokument auswählen"));
    m_button->setCursor(Qt::ArrowCursor);
    m_button->setFocusPolicy(Qt::NoFocus);
    m_button->setVisible(mode == 0);
    connect(m_button, &QToolButton::clicked, this, &VDRFileLineEdit::slotChooseFile);
}

void VDRFileLineEdit::setCompleterData(VDRDocument* document, int tableID, const QString& column,
                                       int columnID)
{
    Q_UNUSED(columnID)
    if (!document || !document->database().isOpen())
        return;
    const QString table = VDRSqlTableModel::sqlTableName(VDRSqlTableModel::TABLE_NAMES(tableID));
    QSqlDatabase db = document->database();
    if (table.isEmpty() || !db.record(table).contains(column))
        return;
    QStringList names;
    QSqlQuery q(db);
    if (q.exec(QStringLiteral("SELECT DISTINCT %1 FROM %2 WHERE %1 IS NOT NULL ORDER BY %1")
                   .arg(column, table))) {
        while (q.next()) {
            const QString name = q.value(0).toString().trimmed();
            if (!name.isEmpty())
                names << name;
        }
    }
    auto* completer = new QCompleter(names, this);
    completer->setCaseSensitivity(Qt::CaseInsensitive);
    setCompleter(completer);
}

void VDRFileLineEdit::resizeEvent(QResizeEvent* event)
{
    QLineEdit::resizeEvent(event);
    const int side = m_button->isVisible() ? height() : 0;
    m_button->setGeometry(width() - side, 0, side, side);
    setTextMargins(0, 0, side, 0);
}

void VDRFileLineEdit::slotChooseFile()
{
    setProperty("editorBusy", true);
    const QPointer<VDRFileLineEdit> self(this);
    const QString path = VDRPrompt::instance()->openFileName(tr("Dokument auswählen"), QString(), QString());
    if (!self)
        return;
    setProperty("editorBusy", false);
    setFocus();
    if (path.isEmpty())
        return;
    setText(path);
    emit editingFinished();
}
