#include "editing/form/VDREntryWidget.h"
#include "editing/form/VDREntryWidgetLayout.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDREntryNumber.h"
#include "document/VDRPrompt.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRCompleterLineEdit.h"
#include "editing/completion/VDRCompleterTextEdit.h"
#include "editing/form/VDRDataWidgetMapper.h"
#include "editing/form/VDRRichTextEdit.h"
#include "editing/form/VDRRichTextEditDialog.h"
#include "editing/form/VdEvent.h"
#include "editing/form/VdEventsController.h"
#include "editing/reportlist/VDREntryInsertDialog.h"
#include "editing/reportlist/VDREntryNumberDialog.h"
#include "editing/tables/VDRTableView.h"
#include "editing/time/VDRDateEdit.h"
#include "editing/time/VDRTimeEdit.h"
#include "editing/time/VDRTimeRecordingWidget.h"

#include <QApplication>
#include <QCheckBox>
#include <QGridLayout>
#include <QHBoxLayout>
#include <QHeaderView>
#include <QInputDialog>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QRegularExpressionValidator>
#include <QSettings>
#include <QSqlError>
#include <QSqlQuery>
#include <QTabWidget>
#include <QToolButton>
#include <QVBoxLayout>

using namespace VDREntryWidgetLayout;

namespace {
const QString kUidPattern = QStringLiteral("([a-z]|[A-Z]|[0-9]){2}");
const QString kUidSettingsKey = QStringLiteral("entry/UID");
} // namespace

VDREntryWidget::VDREntryWidget(QWidget* parent, VDRSpellChecker* checker)
    : QWidget(parent), m_checker(checker)
{
    setObjectName(QStringLiteral("VDREntryWidget"));
    setWindowTitle(tr("Bautagesbericht"));
    buildLayout();
    VdEventsController::instance()->registerEvent(this, VdEvent::GotoRow);
    showNone();
}

VDREntryWidget::~VDREntryWidget()
{
    VdEventsController::instance()->unregisterReceiver(this);
}

VDRTableView* VDREntryWidget::view(const QString& objectName) const
{
    for (VDRTableView* v : m_views)
        if (v->objectName() == objectName)
            return v;
    return nullptr;
}

QString VDREntryWidget::registerName(VDRRegisterNames::RegisterNames index)
{
    return VDRRegisterNames::registerName(index);
}

QString VDREntryWidget::numberWithIndex(const QString& number, int index)
{
    QString result = number.toUpper();
    if (index >= 1 && index <= 26)
        result += QChar(char16_t(u'a' + index - 1));
    return result;
}

// ---- document ----

void VDREntryWidget::slotDocumentOpened(VDRDocument* document)
{
    m_document = document;
    delete m_mapper;
    m_mapper = new VDRDataWidgetMapper(this);
    m_row = -1;
    m_entryId = 0;
    AddMappings();
    actionGoto(0, -1);
}

void VDREntryWidget::slotDocumentClosed(VDRDocument*)
{
    connectModels(false);
    RemoveMappings();
    delete m_mapper;
    m_mapper = nullptr;
    for (VDRTableView* v : qAsConst(m_views))
        v->setModel(nullptr);
    m_pin.reset();
    m_document = nullptr;
    showNone();
}

void VDREntryWidget::AddMappings()
{
    m_mapper->setModel(m_document->modelEntryAll());
    m_mapper->setSubmitPolicy(VDRDataWidgetMapper::AutoSubmit);
    m_mapper->addMapping(m_date, QStringLiteral("inspection_date"), "date");
    m_mapper->addMapping(m_timeFrom, QStringLiteral("inspection_time_from"), "time");
    m_mapper->addMapping(m_timeTo, QStringLiteral("inspection_time_to"), "time");
    m_mapper->addMapping(m_envTime, QStringLiteral("env_time"), "time");
    m_mapper->addMapping(m_weather[0], QStringLiteral("env_weather1"), "text");
    m_mapper->addMapping(m_weather[1], QStringLiteral("env_weather2"), "text");
    m_mapper->addMapping(m_weather[2], QStringLiteral("env_weather3"), "text");
    m_mapper->addMapping(m_temperature, QStringLiteral("env_temperature"), "text");
    m_mapper->addMapping(m_humidity, QStringLiteral("env_humidity"), "text");
    for (int i = 0; i < 5; ++i)
        m_mapper->addMapping(m_rich[i], QLatin1String(richTextFields[i].column), "richtext");
    m_mapper->addMapping(m_sample, QStringLiteral("construction_material_sample"), "checked");
    m_mapper->addMapping(m_printTelephone, QStringLiteral("print_telephone_notice"), "checked");
    m_mapper->addMapping(m_printNotice, QStringLiteral("print_notice"), "checked");
}

void VDREntryWidget::RemoveMappings()
{
    if (m_mapper)
        m_mapper->clearMapping();
}

void VDREntryWidget::connectModels(bool on)
{
    if (!m_document)
        return;
    QList<QAbstractItemModel*> models{m_document->modelEntryAll()};
    for (int i = 0; i < m_models.size(); ++i)
        if (m_models[i])
            models << m_models[i];
    for (QAbstractItemModel* model : models) {
        if (!model)
            continue;
        if (on)
            connect(model, &QAbstractItemModel::dataChanged, this, &VDREntryWidget::dataChangedHandler,
                    Qt::UniqueConnection);
        else
            disconnect(model, &QAbstractItemModel::dataChanged, this, &VDREntryWidget::dataChangedHandler);
    }
    for (int i = 0; i < m_models.size(); ++i) {
        if (!m_models[i])
            continue;
        // Rows added or removed count as changes as well.
        auto* model = m_models[i].data();
        if (on) {
            connect(model, &QAbstractItemModel::rowsInserted, this, [this] {
                m_dirty = true;
                updateGuiWorkforceCount();
            });
            connect(model, &QAbstractItemModel::rowsRemoved, this, [this] {
                m_dirty = true;
                updateGuiWorkforceCount();
            });
            connect(model, SIGNAL(setItemFocus(QModelIndex)), m_views[i],
                    SLOT(slotSetItemFocusIndex(QModelIndex)));
        } else {
            disconnect(model, &QAbstractItemModel::rowsInserted, this, nullptr);
            disconnect(model, &QAbstractItemModel::rowsRemoved, this, nullptr);
            disconnect(model, SIGNAL(setItemFocus(QModelIndex)), m_views[i],
                       SLOT(slotSetItemFocusIndex(QModelIndex)));
        }
    }
}

// ---- showing ----

void VDREntryWidget::showNone()
{
    m_row = -1;
    m_entryId = 0;
    m_dirty = false;
    if (m_mapper)
        m_mapper->setCurrentRow(-1);
    for (int i = 0; i < 5; ++i)
        m_rich[i]->setCell(nullptr, QModelIndex(), QString());
    updateGui();
    enableGui(false);
}

void VDREntryWidget::commitEditors()
{
    // Focus leaving a field or an open table editor hands its text to the model.
    QWidget* focus = QApplication::focusWidget();
    if (focus && isAncestorOf(focus))
        focus->clearFocus();
    if (m_mapper && m_row >= 0 && !isLocked())
        m_mapper->submit();
}

void VDREntryWidget::actionGoto(int row, int tab)
{
    if (!m_document || !m_document->modelEntryAll()) {
        showNone();
        return;
    }
    // Leaving a report keeps what was typed: it goes into the working copy first.
    actionAskForSubmit();
    connectModels(false);
    actionRevert();

    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->fetch_all();
    if (row < 0 || row >= all->rowCount()) {
        for (int i = 0; i < m_views.size(); ++i) {
            m_views[i]->setModel(nullptr);
            m_models[i] = nullptr;
        }
        m_pin.reset();
        showNone();
        emit currentRowChanged(-1);
        return;
    }
    m_mapper->setCurrentRow(row);
    const int id = all->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    // Pin the new report before the old pin goes, so that its models are never the ones dropped.
    auto pin = std::make_unique<VDRDocument::EntryModelsPin>(m_document, id);
    const auto& layouts = viewLayouts();
    for (int i = 0; i < m_views.size(); ++i) {
        VDRTableView* v = m_views[i];
        v->setSaveMetricsFlag(false);
        VDRSqlTableModel* model = m_document->modelEntry(id, layouts[i].table);
        if (v->model() != model) {
            v->setModel(model);
            if (i == deficiencyView)
                moveDeficiencySections(v);
        }
        m_models[i] = model;
    }
    m_pin = std::move(pin);
    m_entryId = id;
    m_row = row;
    setupViews();
    connectModels(true);
    if (tab >= 1 && tab <= 7)
        m_tabs->setCurrentIndex(tab - 1);
    for (int i = 0; i < 5; ++i) {
        const QString column = QLatin1String(richTextFields[i].column);
        m_rich[i]->setCell(all, all->index(row, column), column);
        m_rich[i]->setFieldNumber(i);
    }
    for (VDRTableView* v : qAsConst(m_views))
        v->setSaveMetricsFlag(true);
    m_dirty = false;
    updateGui();
    enableGui(!isLocked());
    emit currentRowChanged(row);
}

void VDREntryWidget::setupViews()
{
    const auto& layouts = viewLayouts();
    for (int i = 0; i < m_views.size(); ++i) {
        VDRTableView* v = m_views[i];
        v->setAllColumnsHidden();
        for (const Column& c : layouts[i].columns) {
            v->setColumnHidden(QLatin1String(c.name), false);
            v->setColumnWidth(QLatin1String(c.name), c.type, c.width);
        }
        v->setSortingEnabled(false);
        v->resizeColumns();
    }
}

void VDREntryWidget::actionToFirst()
{
    actionGoto(0, -1);
    sendSelectRow();
}

void VDREntryWidget::actionToPrevious()
{
    actionGoto(qMax(0, m_row - 1), -1);
    sendSelectRow();
}

void VDREntryWidget::actionToNext()
{
    if (!m_document)
        return;
    const int count = m_document->modelEntryAll()->rowCount();
    actionGoto(m_row + 1 < count ? m_row + 1 : count - 1, -1);
    sendSelectRow();
}

void VDREntryWidget::actionToLast()
{
    if (!m_document)
        return;
    m_document->modelEntryAll()->fetch_all();
    actionGoto(m_document->modelEntryAll()->rowCount() - 1, -1);
    sendSelectRow();
}

bool VDREntryWidget::actionGotoNumber(const QString& number)
{
    const int row = rowOfNumber(number, -1);
    if (row < 0)
        return false;
    actionGoto(row, -1);
    sendSelectRow();
    return true;
}

bool VDREntryWidget::actionGotoDate(const QDate& date)
{
    if (!m_document || !date.isValid())
        return false;
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->fetch_all();
    for (int row = 0; row < all->rowCount(); ++row) {
        if (all->data(row, QStringLiteral("inspection_date"), Qt::EditRole).toDate() == date) {
            actionGoto(row, -1);
            sendSelectRow();
            return true;
        }
    }
    return false;
}

void VDREntryWidget::sendSelectRow()
{
    if (m_row >= 0)
        VdEventsController::instance()->send_event(VdEvent::SelectRow, m_row);
}

int VDREntryWidget::rowOfNumber(const QString& numberText, int exceptRow) const
{
    if (!m_document)
        return -1;
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->fetch_all();
    for (int row = 0; row < all->rowCount(); ++row)
        if (row != exceptRow && m_document->entryNumberString(row) == numberText)
            return row;
    return -1;
}

bool VDREntryWidget::isLocked() const
{
    if (!m_document || m_row < 0)
        return false;
    return m_document->modelEntryAll()->data(m_row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0;
}

bool VDREntryWidget::is_not_first() const
{
    return m_document && m_row > 0;
}

bool VDREntryWidget::is_not_last() const
{
    return m_document && m_row >= 0 && m_row < m_document->modelEntryAll()->rowCount() - 1;
}

// ---- changes ----

void VDREntryWidget::dataChangedHandler(const QModelIndex& topLeft, const QModelIndex& bottomRight)
{
    if (m_document && sender() == m_document->modelEntryAll() &&
        (m_row < topLeft.row() || m_row > bottomRight.row())) {
        updateGui();
        return;
    }
    m_dirty = true;
    updateGui();
}

void VDREntryWidget::actionSubmit()
{
    if (!m_document || m_row < 0)
        return;
    commitEditors();
    VDRDocument::EntryModelsPin keep(m_document, m_entryId);
    m_document->beginTransaction();
    m_document->modelEntryAll()->submitAll();
    for (const auto& model : qAsConst(m_models))
        if (model)
            model->submitAll();
    m_document->endTransaction();
    m_document->setModified(true);
    m_mapper->setCurrentRow(m_row);
    m_dirty = false;
    updateGui();
}

void VDREntryWidget::actionRevert()
{
    if (!m_document)
        return;
    m_document->modelEntryAll()->revertAll();
    for (const auto& model : qAsConst(m_models))
        if (model)
            model->revertAll();
    if (m_mapper && m_row >= 0)
        m_mapper->setCurrentRow(m_row);
    m_dirty = false;
    updateGui();
}

void VDREntryWidget::on_pushButtonRevert_clicked()
{
    if (VDRPrompt::instance()->question(VDRPrompt::Question, tr("Änderungen verwerfen"),
                                        tr("Möchten Sie die Änderungen tatsächlich verwerfen?"),
                                        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::No,
                                        VDRPrompt::No) != VDRPrompt::Yes)
        return;
    actionRevert();
}

bool VDREntryWidget::actionAskForSubmit()
{
    if (!m_document || m_row < 0)
        return false;
    commitEditors();
    if (!m_dirty)
        return false;
    actionSubmit();
    return true;
}

bool VDREntryWidget::event(QEvent* event)
{
    if (int(event->type()) == VdEvent::GotoRow) {
        actionAskForSubmit();
        actionGoto(static_cast<VdEvent*>(event)->arg(0).toInt(), -1);
        return true;
    }
    return QWidget::event(event);
}

// ---- gui ----

QString VDREntryWidget::headLine() const
{
    return m_headLine->text();
}

void VDREntryWidget::updateGui()
{
    if (!m_document || m_row < 0) {
        m_headLine->setText(tr("<b>Kein Bericht ausgewählt.</b>"));
        m_audio->setIcon(QIcon(QStringLiteral(":/VDRMainWindow/Resources/icon-dictation-none.png")));
        m_workforceCount->setText(tr("%1 Personen").arg(0));
        m_date->setPlaceholderText(QString());
        return;
    }
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    const VDREntryNumber stored = m_document->entryNumber(m_row);
    const QString& userId = stored.userId();
    const QString number = VDREntryNumber::compose(stored.withoutDraft(), userId, !isLocked());
    const QVariant rawDate = all->data(m_row, QStringLiteral("inspection_date"), Qt::EditRole);
    const QDate date = rawDate.toDate();
    const QString dateText = QLocale().toString(date, QLocale::ShortFormat);
    // An unreadable stored date is shown empty, with the stored text as a hint.
    m_date->setPlaceholderText(!date.isValid() && !rawDate.toString().trimmed().isEmpty()
                                   ? tr("ungültig: %1").arg(rawDate.toString().left(20))
                                   : QString());
    const QString name = m_document->projectName().toHtmlEscaped();
    if (userId.isEmpty())
        m_headLine->setText(tr("<b>Projekt: %0, Baubericht %1 vom %2</b>").arg(name, number, dateText));
    else
        m_headLine->setText(tr("<b>Projekt: %0, Baubericht %1 vom %2<br>Bericht erstellt von: %3</b>")
                                .arg(name, number, dateText, userId.toHtmlEscaped()));

    QString icon = QStringLiteral(":/VDRMainWindow/Resources/icon-dictation-none.png");
    const int audioId = all->data(m_row, QStringLiteral("progress_audio_id"), Qt::EditRole).toInt();
    if (audioId > 0) {
        QSqlQuery q(m_document->database());
        q.prepare(QStringLiteral("SELECT recording_status FROM audio WHERE id = :id"));
        q.bindValue(QStringLiteral(":id"), audioId);
        if (!q.exec())
            VDRPrompt::critical(tr("SQL Error"), q.lastError().text());
        else if (q.next()) {
            const int status = q.value(0).toInt();
            if (status == 2)
                icon = QStringLiteral(":/VDRMainWindow/Resources/icon-dictation-completed.png");
            else if (status == 1)
                icon = QStringLiteral(":/VDRMainWindow/Resources/icon-dictation-pending.png");
        }
    }
    m_audio->setIcon(QIcon(icon));
    updateGuiWorkforceCount();
}

void VDREntryWidget::updateGuiWorkforceCount()
{
    int total = 0;
    if (VDRSqlTableModel* model = m_models.value(1)) {
        const int column = model->fieldIndex(QStringLiteral("person_count"));
        for (int row = 0; row < model->rowCount(); ++row)
            total += model->data(model->index(row, column), Qt::EditRole).toInt();
    }
    m_workforceCount->setText(tr("%1 Personen").arg(total));
}

void VDREntryWidget::enableGui(bool enable)
{
    for (QWidget* w : std::initializer_list<QWidget*>{
             m_date, m_timeFrom, m_timeTo, m_envTime, m_weather[0], m_weather[1], m_weather[2], m_temperature,
             m_humidity, m_sample, m_printTelephone, m_printNotice, m_finish, m_save, m_revert})
        w->setEnabled(enable);
    for (VDRRichTextEdit* r : m_rich)
        r->setReadOnly(!enable);
    for (VDRTableView* v : qAsConst(m_views)) {
        v->disable_editors(enable);
        v->setDragEnabled(enable);
        v->setAcceptDrops(enable);
        v->setSelectionMode(enable ? QAbstractItemView::SingleSelection : QAbstractItemView::NoSelection);
        v->setEditTriggers(enable ? QAbstractItemView::DoubleClicked | QAbstractItemView::SelectedClicked |
                                        QAbstractItemView::EditKeyPressed | QAbstractItemView::AnyKeyPressed
                                  : QAbstractItemView::NoEditTriggers);
        v->buttonAdd()->setEnabled(enable);
        v->buttonDelete()->setEnabled(enable);
    }
    VdEventsController::instance()->send_event(VdEvent::EnableEditors, enable);
}

void VDREntryWidget::setSyncButtonVisible(bool visible)
{
    m_sync->setVisible(visible);
}

void VDREntryWidget::slotEnlarge(VDRRichTextEdit* edit)
{
    if (!m_document || m_row < 0)
        return;
    VDRRichTextEditDialog dialog(edit->cellModel(), edit->cellColumn(), edit->cellIndex(),
                                 edit->fieldNumber(), this);
    dialog.setText(edit->html());
    dialog.editor()->setReadOnly(isLocked());
    if (dialog.exec() != QDialog::Accepted || isLocked())
        return;
    edit->setHtml(dialog.text());
    m_mapper->submit();
}

// ---- report operations ----

void VDREntryWidget::actionNew()
{
    if (!m_document)
        return;
    actionAskForSubmit();
    const int result = m_document->appendEntry();
    if (result != 1)
        return;
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->submitAll();
    m_document->setModified(true);
    all->fetch_all();
    const int number = qMax(m_document->entryNumberInt(0), m_document->entryNumberInt(all->rowCount() - 1));
    const int digits = qMax(3, m_document->entryNumberDigits(0));
    actionGotoNumber(VDREntryNumber::padded(number, digits));
}

void VDREntryWidget::actionCopy()
{
    if (!m_document || m_row < 0)
        return;
    actionAskForSubmit();
    if (!m_document->copyEntryAll(m_row))
        return;
    m_document->setModified(true);
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->fetch_all();
    const int last = all->rowCount() - 1;
    actionGoto(m_document->entryNumberInt(0) < m_document->entryNumberInt(last) ? last : 0, -1);
    sendSelectRow();
}

bool VDREntryWidget::externalNumberAccepted(const QString& number) const
{
    VDRSqlTableModel* ext = m_document->modelExternalEntryNumber();
    if (!ext)
        return true;
    ext->fetch_all();
    for (int row = 0; row < ext->rowCount(); ++row) {
        if (!VDREntryNumber::sameNumber(m_document->externalEntryNumberString(row), number))
            continue;
        const QString file = ext->data(row, QStringLiteral("filepath"), Qt::EditRole).toString();
        return VDRPrompt::instance()->question(VDRPrompt::Warning, tr("Warnung"),
                                               tr("Die Nummer %1 ist bereits in der Vorgänger-Datei %2 "
                                                  "vergeben!\nNummer trotzdem vergeben?")
                                                   .arg(number, file),
                                               VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::No,
                                               VDRPrompt::No) == VDRPrompt::Yes;
    }
    return true;
}

void VDREntryWidget::storeNumber(int row, const QString& number)
{
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->setData(row, QStringLiteral("number"), number, Qt::EditRole);
    m_document->entrySetNumberText(row);
    VDRSqlTableModel* vdr = m_document->modelVdr();
    const int value = number.left(VDREntryNumber(number).digits()).toInt();
    const int vdrRow = vdr->rowById(1);
    if (vdrRow >= 0 && value > vdr->data(vdrRow, QStringLiteral("entrycounter"), Qt::EditRole).toInt())
        vdr->setData(vdrRow, QStringLiteral("entrycounter"), value, Qt::EditRole);
    m_document->beginTransaction();
    vdr->submitAll();
    all->submitAll();
    m_document->endTransaction();
    m_document->setModified(true);
}

bool VDREntryWidget::insertWithNumber(const QString& numberText, int index)
{
    if (!m_document)
        return false;
    const QString number = numberWithIndex(numberText, index);
    if (rowOfNumber(number, -1) >= 0) {
        VDRPrompt::critical(tr("Fehler"), tr("Die Nummer %1 ist bereits vergeben!").arg(number));
        return false;
    }
    if (!externalNumberAccepted(number))
        return false;
    actionAskForSubmit();
    if (m_document->appendEntry() != 1)
        return false;
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->submitAll();
    all->fetch_all();
    const int row = all->rowById(m_document->maxEntryID());
    if (row < 0)
        return false;
    storeNumber(row, number);
    actionGotoNumber(number);
    return true;
}

bool VDREntryWidget::alterNumberTo(const QString& numberText, int index)
{
    if (!m_document || m_row < 0 || isLocked())
        return false;
    const QString number = numberWithIndex(numberText, index);
    if (rowOfNumber(number, m_row) >= 0) {
        VDRPrompt::critical(tr("Fehler"), tr("Die Nummer %1 ist bereits vergeben!").arg(number));
        return false;
    }
    if (!externalNumberAccepted(number))
        return false;
    const int row = m_row;
    storeNumber(row, number);
    actionGoto(row, -1);
    sendSelectRow();
    return true;
}

void VDREntryWidget::actionInsert()
{
    if (!m_document)
        return;
    VDREntryInsertDialog dialog(m_document, this);
    if (m_row >= 0)
        dialog.setEntry(m_document->entryNumber(m_row));
    if (dialog.exec() != QDialog::Accepted)
        return;
    const char letter = dialog.getEntryLetter();
    insertWithNumber(dialog.getEntryNumber(), letter ? letter - 'a' + 1 : 0);
}

void VDREntryWidget::actionAlterNumber()
{
    if (!m_document || m_row < 0 || isLocked())
        return;
    actionAskForSubmit();
    VDREntryNumberDialog dialog(m_document, this);
    dialog.setEntry(m_document->entryNumber(m_row));
    if (dialog.exec() != QDialog::Accepted)
        return;
    const char chosen = dialog.getEntryLetter();
    alterNumberTo(dialog.getEntryNumber(), chosen ? chosen - 'a' + 1 : 0);
}

void VDREntryWidget::actionDelete()
{
    if (!m_document || m_row < 0)
        return;
    if (isLocked()) {
        VDRPrompt::information(tr("Bericht löschen"),
                               tr("Sie können einen abgeschlossenen Bericht nicht löschen!"));
        return;
    }
    if (VDRPrompt::instance()->question(
            VDRPrompt::Question, tr("Bericht löschen"), tr("Möchten Sie den Bericht wirklich löschen?"),
            VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::No, VDRPrompt::No) != VDRPrompt::Yes)
        return;
    const int row = m_row;
    commitEditors();
    connectModels(false);
    actionRevert();
    // The models of the report go with it; the views must not keep them.
    for (int i = 0; i < m_views.size(); ++i) {
        m_views[i]->setModel(nullptr);
        m_models[i] = nullptr;
    }
    m_pin.reset();
    m_row = -1;
    m_entryId = 0;
    if (!m_document->removeEntryAll(row)) {
        actionGoto(row, -1);
        return;
    }
    m_document->setModified(true);
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    all->fetch_all();
    if (all->rowCount() == 0) {
        actionGoto(-1, -1);
        return;
    }
    const int next = qMin(row, all->rowCount() - 1);
    actionGoto(next, -1);
    sendSelectRow();
}

void VDREntryWidget::on_pushButtonFinish_clicked()
{
    if (!m_document || m_row < 0 || isLocked())
        return;
    actionAskForSubmit();
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    QString text = tr("Wenn Sie den Bericht abschließen, können Sie keine Änderungen mehr daran vornehmen.");
    const int audioId = all->data(m_row, QStringLiteral("progress_audio_id"), Qt::EditRole).toInt();
    if (audioId > 0) {
        QSqlQuery q(m_document->database());
        q.prepare(QStringLiteral("SELECT recording_status FROM audio WHERE id = :id"));
        q.bindValue(QStringLiteral(":id"), audioId);
        const int status = q.exec() && q.next() ? q.value(0).toInt() : 0;
        if (status == 2)
            text += tr("\nDer Bericht enthält ein erledigtes Diktat. Dieses Diktat wird beim Abschließen des "
                       "Berichts gelöscht.");
        else if (status == 1)
            text += tr("\nDer Bericht enthält ein anhängiges Diktat. Dieses Diktat wird beim Abschließen des "
                       "Berichts gelöscht.");
        else
            text += tr("\nDer Bericht enthält ein Diktat. Dieses Diktat wird beim Abschließen des Berichts "
                       "gelöscht.");
    }
    text += tr(" Fortsetzen?");
    if (VDRPrompt::instance()->question(VDRPrompt::Question, tr("Bericht abschließen"), text,
                                        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::No,
                                        VDRPrompt::No) != VDRPrompt::Yes)
        return;
    const int row = m_row;
    if (audioId > 0) {
        m_document->deleteAudioRecord(audioId);
        all->setData(row, QStringLiteral("progress_audio_id"), 0, Qt::EditRole);
    }
    m_document->lockEntry(row, true);
    m_document->setModified(true);
    actionGoto(row, -1);
    sendSelectRow();
}

QString VDREntryWidget::askUserId(const QString& title, const QString& text, const QString& preset, bool* ok)
{
    QInputDialog dialog(this);
    dialog.setObjectName(QStringLiteral("userIdDialog"));
    dialog.setWindowTitle(title);
    dialog.setLabelText(text);
    dialog.setTextValue(preset);
    if (auto* edit = dialog.findChild<QLineEdit*>()) {
        edit->setMaxLength(2);
        edit->setValidator(new QRegularExpressionValidator(QRegularExpression(kUidPattern), edit));
    }
    *ok = dialog.exec() == QDialog::Accepted;
    return dialog.textValue().trimmed();
}

void VDREntryWidget::actionSettingsChangeUID()
{
    QSettings settings;
    const QString current = settings.value(kUidSettingsKey).toString();
    const QString text = current.isEmpty() ? tr("Geben Sie hier die Benutzer-ID (max. 2 Zeichen) des "
                                                "aktuellen Autors ein. Die Benutzer-ID wird "
                                                "automatisch in neue Berichte eingetragen.")
                                           : tr("Ändern Sie hier die Benutzer-ID (max. 2 Zeichen) des "
                                                "aktuellen Autors. Die Benutzer-ID wird "
                                                "automatisch in neue Berichte eingetragen.");
    bool ok = false;
    const QString code =
        askUserId(tr("Benutzer-ID ändern"), text + QLatin1Char('\n') + tr("Benutzer-ID:"), current, &ok);
    if (!ok)
        return;
    if (code.isEmpty())
        settings.remove(kUidSettingsKey);
    else
        settings.setValue(kUidSettingsKey, code);
    if (m_row >= 0) {
        actionGoto(m_row, -1);
        sendSelectRow();
    }
}

void VDREntryWidget::actionEntryChangeUID()
{
    if (!m_document || m_row < 0)
        return;
    VDRAllEntryTableModel* all = m_document->modelEntryAll();
    const QString number = m_document->entryNumberString(m_row);
    const QString userId = all->data(m_row, QStringLiteral("user_id"), Qt::EditRole).toString();
    if (isLocked()) {
        VDRPrompt::warning(tr("Autor ändern"),
                           tr("Sie können den Autor für den Bericht %1 nicht ändern, da der Bericht "
                              "abgeschlossen ist.")
                               .arg(number));
        return;
    }
    if (!userId.isEmpty() && !all->data(m_row, QStringLiteral("creation_date"), Qt::EditRole).isNull()) {
        VDRPrompt::warning(
            tr("Autor ändern"),
            tr("Sie können den Autor für den Bericht %1 nicht ändern, da der Bericht auf einem "
               "mobilen Gerät erstellt wurde.")
                .arg(number));
        return;
    }
    actionAskForSubmit();
    const QString preset = userId.isEmpty() ? QSettings().value(kUidSettingsKey).toString() : userId;
    bool ok = false;
    const QString code = askUserId(tr("Autor des Berichts ändern"),
                                   tr("Ändern Sie hier den Autor des Berichts %1.").arg(number) +
                                       QLatin1Char('\n') + tr("Autor:"),
                                   preset, &ok);
    if (!ok)
        return;
    const int row = m_row;
    all->setData(row, QStringLiteral("user_id"), code, Qt::EditRole);
    all->submitAll();
    m_document->setModified(true);
    actionGoto(row, -1);
    sendSelectRow();
}

void VDREntryWidget::setSpellChecker(VDRSpellChecker* checker)
{
    m_checker = checker;
    for (VDRRichTextEdit* r : m_rich)
        r->textEdit()->setSpellChecker(checker);
}
