#include "editing/completion/VDRCompleter.h"

#include "document/VDRPrompt.h"
#include "editing/completion/CompleterEditor.h"
#include "export/VDRCompleterExchange.h"

#include <QAbstractItemView>
#include <QDateTime>
#include <QKeyEvent>
#include <QLineEdit>
#include <QLocale>
#include <QPlainTextEdit>
#include <QScrollBar>
#include <QSettings>
#include <QStringListModel>
#include <QTextEdit>

const QString VDRCompleter::SimpleColumn = QStringLiteral("simple");
const QString VDRCompleter::DontShowMessageSettingsKey = QStringLiteral("Messages/dontShowCompleterMsg");

namespace {
QList<VDRCompleter*>& registry()
{
    static QList<VDRCompleter*> completers;
    return completers;
}
} // namespace

VDRCompleter::VDRCompleter(int regIdx, QString title, int tableID, QString column, int columnID,
                           QObject* widget)
    : QCompleter(widget), m_regIdx(regIdx), m_title(std::move(title)), m_tableID(tableID),
      m_column(column.isEmpty() ? SimpleColumn : std::move(column)), m_columnID(columnID),
      m_model(new QStringListModel(this))
{
    if (auto* field = qobject_cast<QWidget*>(widget))
        setWidget(field);
    setModel(m_model);
    setCaseSensitivity(Qt::CaseInsensitive);
    setCompletionMode(QCompleter::PopupCompletion);
    setModelSorting(QCompleter::UnsortedModel);
    CompleterEditor::resetToDefaults(true);
    readSettings();
    // An imported Completer.xml must reach the live lists before they write theirs back.
    static const bool importRefreshes =
        (VDRCompleterExchange::setListsReplacedHandler(&VDRCompleter::updateAll), true);
    Q_UNUSED(importRefreshes)
    registry().append(this);
}

VDRCompleter::~VDRCompleter()
{
    registry().removeAll(this);
}

int VDRCompleter::language()
{
    return QSettings().value(QStringLiteral("language"), int(QLocale::system().language())).toInt();
}

QString VDRCompleter::settingsGroup()
{
    return QStringLiteral("completer_%1").arg(language());
}

QString VDRCompleter::displayText(const QString& entry)
{
    QString text = entry;
    text.replace(QLatin1String("\r\n"), QLatin1String(" | "));
    for (QChar lineBreak :
         {QChar('\n'), QChar('\r'), QChar(QChar::LineSeparator), QChar(QChar::ParagraphSeparator)})
        text.replace(lineBreak, QLatin1String(" | "));
    text = text.simplified();
    if (text.size() >= MaxDisplayLength)
        text.truncate(MaxDisplayLength);
    return text;
}

QString VDRCompleter::listGroup() const
{
    return settingsGroup() + QLatin1Char('/') + m_title + QLatin1Char('/') + m_column;
}

void VDRCompleter::readSettings()
{
    QSettings settings;
    settings.beginGroup(listGroup());
    m_enabled = settings.value(QStringLiteral("enabled"), true).toBool();
    m_entries.clear();
    const int count = settings.beginReadArray(QStringLiteral("values"));
    for (int i = 0; i < count; ++i) {
        settings.setArrayIndex(i);
        m_entries << settings.value(QStringLiteral("centry")).toString();
    }
    settings.endArray();
    rebuildModel();
}

void VDRCompleter::writeSettings(bool withUpdateTime)
{
    QSettings settings;
    settings.beginGroup(settingsGroup());
    settings.beginGroup(m_title);
    settings.setValue(QStringLiteral("tableID"), m_tableID);
    settings.beginGroup(m_column);
    settings.setValue(QStringLiteral("enabled"), m_enabled);
    settings.setValue(QStringLiteral("regIdx"), m_regIdx);
    settings.setValue(QStringLiteral("columnID"), m_columnID);
    if (withUpdateTime)
        settings.setValue(QStringLiteral("updateTime"), QDateTime::currentDateTime().toString(Qt::TextDate));
    // A shorter list must not leave old items behind.
    settings.remove(QStringLiteral("values"));
    settings.beginWriteArray(QStringLiteral("values"), m_entries.size());
    for (int i = 0; i < m_entries.size(); ++i) {
        settings.setArrayIndex(i);
        settings.setValue(QStringLiteral("centry"), m_entries.at(i));
    }
    settings.endArray();
}

void VDRCompleter::rebuildModel()
{
    m_display.clear();
    for (const QString& entry : qAsConst(m_entries))
        m_display << displayText(entry);
    m_model->setStringList(m_display);
}

void VDRCompleter::appendEntry(QString text)
{
    text = text.trimmed();
    if (text.isEmpty() || m_entries.contains(text))
        return;
    m_entries.prepend(text);
    rebuildModel();
    writeSettings(false);
    // Fields sharing the list offer the new text at once.
    for (VDRCompleter* other : qAsConst(registry())) {
        if (other != this && other->m_title == m_title && other->m_column == m_column)
            other->updateStatus();
    }
}

void VDRCompleter::removeEntry(int index)
{
    if (index < 0 || index >= m_entries.size())
        return;
    m_entries.removeAt(index);
    rebuildModel();
    writeSettings(false);
}

QString VDRCompleter::getMultiLineEntry(const QString& display) const
{
    const int row = m_display.indexOf(display);
    return row < 0 ? display : m_entries.at(row);
}

void VDRCompleter::setActive(bool active)
{
    m_enabled = active;
    if (!active && popup())
        popup()->hide();
}

void VDRCompleter::updateStatus()
{
    readSettings();
}

void VDRCompleter::updateFromWidget()
{
    if (auto* line = qobject_cast<QLineEdit*>(widget()))
        appendEntry(line->text());
    else if (auto* text = qobject_cast<QTextEdit*>(widget()))
        appendEntry(text->toPlainText());
    else if (auto* plain = qobject_cast<QPlainTextEdit*>(widget()))
        appendEntry(plain->toPlainText());
}

void VDRCompleter::resetCompleterRegIdx(int regIdx)
{
    m_regIdx = regIdx;
}

bool VDRCompleter::popupTakesKey(QKeyEvent* event) const
{
    if (!popup() || !popup()->isVisible())
        return false;
    switch (event->key()) {
    case Qt::Key_Escape:
    case Qt::Key_Tab:
    case Qt::Key_Backtab:
        return true;
    case Qt::Key_Return:
    case Qt::Key_Enter:
        // Without a chosen row Return belongs to the field (a new line), not to the popup.
        return popup()->currentIndex().isValid();
    default:
        return false;
    }
}

void VDRCompleter::offer(QKeyEvent* event, const QString& prefix, const QRect& cursorRect)
{
    const bool ctrlE = event->key() == Qt::Key_E && (event->modifiers() & Qt::ControlModifier);
    const bool wasVisible = popup()->isVisible();
    popup()->hide();
    // Backspace closes an open popup instead of narrowing it again.
    if (event->key() == Qt::Key_Backspace && wasVisible)
        return;
    static const QString stopCharacters = QStringLiteral("~!@#$%^&*()_+{}|:\"<>?,./;'[]\\-=");
    if (!ctrlE && (!m_enabled || prefix.isEmpty() || stopCharacters.contains(prefix.right(1))))
        return;
    setCompletionPrefix(prefix);
    if (!ctrlE && completionCount() == 1 && completionModel()->index(0, 0).data().toString() == prefix)
        return;
    openPopup(cursorRect);
}

void VDRCompleter::showAll(const QRect& rect)
{
    if (size() == 0) {
        QSettings settings;
        if (settings.value(DontShowMessageSettingsKey, false).toBool())
            return;
        bool dontShow = false;
        const int answer = VDRPrompt::instance()->choose(
            VDRPrompt::Information, tr("Autotexte"),
            tr("Diese Funktion erlaubt das automatische Einfügen der Texte, die bisher in dieses Feld "
               "eingetragen "
               "wurden.\nFür dieses Feld stehen noch keine gespeicherten Eingaben zur Verfügung. Sobald "
               "einmal Text "
               "eingegeben wurde, wird dieser für künftige Berichte in diesem Feld zur Auswahl "
               "angeboten.\n\nSie "
               "können Ihre Textblöcke auch löschen, ändern, oder manuell neue Texte hinzufügen.\n"),
            {tr("Autotexte bearbeiten"), tr("Schließen")}, 1, 1, tr("Diese Meldung nicht mehr anzeigen"),
            &dontShow);
        if (dontShow)
            settings.setValue(DontShowMessageSettingsKey, true);
        if (answer == 0)
            CompleterEditor::editCompleters(widget());
        return;
    }
    setCompletionPrefix(QString());
    openPopup(rect);
}

void VDRCompleter::openPopup(const QRect& rect)
{
    if (completionCount() == 0 || !widget())
        return;
    popup()->setCurrentIndex(QModelIndex());
    QRect r = rect;
    r.setWidth(popup()->sizeHintForColumn(0) + popup()->verticalScrollBar()->sizeHint().width());
    complete(r);
}

QList<VDRCompleter*> VDRCompleter::liveCompleters()
{
    return registry();
}

void VDRCompleter::writeAll()
{
    for (VDRCompleter* completer : qAsConst(registry()))
        completer->writeSettings(false);
}

void VDRCompleter::updateAll()
{
    for (VDRCompleter* completer : qAsConst(registry()))
        completer->updateStatus();
}

void VDRCompleter::migrateSettings()
{
    CompleterEditor::resetToDefaults(true);
}
