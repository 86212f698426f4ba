#include "editing/time/VDRTimeRecordingWidget.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"
#include "document/VDRSqlTableModel.h"
#include "editing/tables/VDRTableView.h"

#include <QDialogButtonBox>
#include <QHBoxLayout>
#include <QHeaderView>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QSettings>
#include <QSqlRecord>
#include <QTime>
#include <QVBoxLayout>

const QString VDRTimeRecordingWidget::ColumnsSettingsKey = QStringLiteral("TimeRecordingWidget/colums");
const QString VDRTimeRecordingWidget::RowsSettingsKey = QStringLiteral("TimeRecordingWidget/rows");
const QString VDRTimeRecordingWidget::WidthSettingsKey = QStringLiteral("TimeRecordingWidget/width");
const QString VDRTimeRecordingWidget::HeightSettingsKey = QStringLiteral("TimeRecordingWidget/height");

namespace {
const char* const kColumns[] = {"person_count", "person_type", "time_from", "time_to", "breaks", "hours"};

QVariantList toVariantList(const QList<int>& values)
{
    QVariantList list;
    for (int v : values)
        list << v;
    return list;
}
} // namespace

VDRTimeRecordingWidget::VDRTimeRecordingWidget(QWidget* parent)
    : QDialog(parent), m_view(new VDRTableView(this)), m_total(new QLineEdit(this))
{
    setWindowTitle(tr("Baustellenbesetzung und Zeiterfassung "));
    setWindowIcon(QIcon(QStringLiteral(":/VDRMainWindow/Resources/icon-zeiterfassung-eingabedialog.png")));
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(new QLabel(tr("Personen- und Zeiterfassung zur Baustellenbesetzung"), this));
    layout->addWidget(m_view);
    auto* totalLine = new QHBoxLayout;
    totalLine->addStretch();
    totalLine->addWidget(new QLabel(tr("Gesamtsumme"), this));
    m_total->setReadOnly(true);
    m_total->setAlignment(Qt::AlignRight | Qt::AlignVCenter);
    totalLine->addWidget(m_total);
    totalLine->addWidget(new QLabel(tr("Mannstunden"), this));
    layout->addLayout(totalLine);
    auto* buttons = new QDialogButtonBox(this);
    buttons->addButton(tr("OK"), QDialogButtonBox::AcceptRole);
    buttons->addButton(tr("Abbrechen"), QDialogButtonBox::RejectRole);
    layout->addWidget(buttons);
    connect(buttons, &QDialogButtonBox::accepted, this, &VDRTimeRecordingWidget::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &VDRTimeRecordingWidget::reject);
    m_view->setFlagAutodelete(true);
    connect(m_view, &VDRTableView::signalButtonAddClicked, this,
            &VDRTimeRecordingWidget::slot_addButtonClicked);
    connect(m_view, &VDRTableView::signalButtonDeleteClicked, this,
            &VDRTimeRecordingWidget::slot_removeButtonClicked);
    QSettings settings;
    resize(settings.value(WidthSettingsKey, 640).toInt(), settings.value(HeightSettingsKey, 360).toInt());
}

VDRTimeRecordingWidget::~VDRTimeRecordingWidget()
{
    restoreFilter();
}

bool VDRTimeRecordingWidget::prepare()
{
    if (!m_document || m_entryId <= 0)
        return false;
    if (!m_model)
        m_model = m_document->modelEntryTimeRecording(m_entryId);
    if (!m_model)
        return false;
    if (!m_prepared) {
        m_prepared = true;
        m_connections << connect(m_model, &VDRSqlTableModel::hoursChangedByUser, this,
                                 &VDRTimeRecordingWidget::slotHoursChangedByUser);
        m_connections << connect(m_model, &VDRSqlTableModel::timeRecordingTimeChangedByUser, this,
                                 &VDRTimeRecordingWidget::slotUpdateHours);
        m_connections << connect(m_model, &VDRSqlTableModel::calculateHours4TimeRecording, this,
                                 &VDRTimeRecordingWidget::slotCalculateTotalHours);
        // The report's model lists every workforce row's times; it does so again when the dialog ends.
        m_previousFilter = m_model->filter();
        m_model->setFilter(QStringLiteral("entry_id='") + QString::number(m_entryId) + QLatin1Char('\'') +
                           QStringLiteral(" AND workforce_id='") + QString::number(m_workforceId) +
                           QLatin1Char('\''));
        m_model->select();
        m_model->fetch_all();
    }
    m_view->setModel(m_model);
    m_view->setDragDropMode(QAbstractItemView::DragDrop);
    m_view->setSelectionMode(QAbstractItemView::SingleSelection);
    m_view->setSortingEnabled(false);
    m_view->setAllColumnsHidden();
    for (const char* column : kColumns)
        m_view->setColumnHidden(QLatin1String(column), false);
    const QVariantList stored = QSettings().value(ColumnsSettingsKey).toList();
    if (stored.size() == int(sizeof(kColumns) / sizeof(kColumns[0]))) {
        for (int i = 0; i < stored.size(); ++i)
            m_view->setColumnWidth(QLatin1String(kColumns[i]), VDRTableView::CWT_PIXEL,
                                   qBound(10, stored.at(i).toInt(), 2000));
    } else {
        m_view->setColumnWidth(QStringLiteral("person_count"), VDRTableView::CWT_PIXEL, 50);
        m_view->setColumnWidth(QStringLiteral("person_type"), VDRTableView::CWT_PERCENT, 100);
        for (const char* column : {"time_from", "time_to", "breaks", "hours"})
            m_view->setColumnWidth(QLatin1String(column), VDRTableView::CWT_PIXEL, 70);
    }
    const QVariantList heights = QSettings().value(RowsSettingsKey).toList();
    for (int row = 0; row < heights.size() && row < m_model->rowCount(); ++row)
        m_view->setRowHeight(row, qBound(10, heights.at(row).toInt(), 1000));
    m_view->resizeColumns();
    m_connections << connect(m_model, &QAbstractItemModel::dataChanged, this,
                             &VDRTimeRecordingWidget::dataChangedHandler);
    slotCalculateTotalHours();
    VDRAllEntryTableModel* entries = m_document->modelEntryAll();
    const bool locked =
        entries && entries->dataById(m_entryId, QStringLiteral("locked"), Qt::EditRole).toInt() == 1;
    m_view->setButtonBigviewVisible(false);
    if (locked) {
        m_view->setButtonAddVisible(false);
        m_view->setButtonDeleteVisible(false);
        m_view->disable_editors(false);
    }
    return true;
}

int VDRTimeRecordingWidget::exec()
{
    if (!prepare())
        return 0;
    // The report's models stay while the dialog is open, whatever else is opened meanwhile.
    VDRDocument::EntryModelsPin pin(m_document, m_entryId);
    return QDialog::exec() == QDialog::Accepted ? 1 : 0;
}

void VDRTimeRecordingWidget::restoreFilter()
{
    for (const QMetaObject::Connection& connection : qAsConst(m_connections))
        disconnect(connection);
    m_connections.clear();
    if (m_prepared && m_model) {
        m_prepared = false;
        m_model->setFilter(m_previousFilter);
        m_model->select();
    }
}

bool VDRTimeRecordingWidget::isRemoved(int row) const
{
    // Rows removed but not yet submitted stay in the model, marked in the vertical header.
    return m_model->headerData(row, Qt::Vertical).toString() == QLatin1String("!");
}

void VDRTimeRecordingWidget::calculateHours(int row)
{
    if (!m_model || row < 0 || row >= m_model->rowCount())
        return;
    const QVariant count = m_model->data(row, QStringLiteral("person_count"), Qt::EditRole);
    const QVariant from = m_model->data(row, QStringLiteral("time_from"), Qt::EditRole);
    const QVariant to = m_model->data(row, QStringLiteral("time_to"), Qt::EditRole);
    const QVariant breaks = m_model->data(row, QStringLiteral("breaks"), Qt::EditRole);
    QVariant hours(QVariant::Double);
    if (!count.isNull() && !from.isNull() && !to.isNull() && from.toTime().isValid() &&
        to.toTime().isValid()) {
        int seconds = from.toTime().secsTo(to.toTime());
        if (seconds < 0)
            seconds += 86400;
        double duration = seconds / 3600.0;
        if (!breaks.isNull())
            duration -= breaks.toInt() / 60.0;
        hours = count.toInt() * duration;
    }
    m_model->setData(row, QStringLiteral("hours"), hours);
    slotCalculateTotalHours();
}

void VDRTimeRecordingWidget::dataChangedHandler(const QModelIndex& topLeft, const QModelIndex& bottomRight)
{
    m_dirty = true;
    if (topLeft == bottomRight && topLeft.column() == m_model->fieldIndex(QStringLiteral("person_count")))
        calculateHours(topLeft.row());
    else
        slotCalculateTotalHours();
}

void VDRTimeRecordingWidget::slotUpdateHours(const QModelIndex& index, bool valid)
{
    if (!m_model || !index.isValid())
        return;
    const int row = index.row();
    const QString field = m_model->record().fieldName(index.column());
    const bool timeColumn = field == QLatin1String("time_from") || field == QLatin1String("time_to");
    if (timeColumn && !valid) {
        m_model->setData(row, QStringLiteral("hours"), QVariant(QVariant::Double));
        slotCalculateTotalHours();
        return;
    }
    const bool times = m_model->data(row, QStringLiteral("time_from"), Qt::EditRole).toTime().isValid() &&
                       m_model->data(row, QStringLiteral("time_to"), Qt::EditRole).toTime().isValid();
    if (!m_model->data(row, QStringLiteral("person_count"), Qt::EditRole).isNull() && times)
        calculateHours(row);
}

void VDRTimeRecordingWidget::slotHoursChangedByUser(const QModelIndex& index)
{
    if (!m_model || !index.isValid())
        return;
    // A row carries either times or a typed figure.
    m_model->setData(index.row(), QStringLiteral("time_from"), QVariant(QVariant::Time));
    m_model->setData(index.row(), QStringLiteral("time_to"), QVariant(QVariant::Time));
    m_model->setData(index.row(), QStringLiteral("breaks"), QVariant(QVariant::Int));
    slotCalculateTotalHours();
}

void VDRTimeRecordingWidget::slotCalculateTotalHours()
{
    m_totalHours = 0;
    m_totalHoursValid = false;
    m_totalPersons = 0;
    QStringList types;
    if (m_model) {
        for (int row = 0; row < m_model->rowCount(); ++row) {
            if (isRemoved(row))
                continue;
            const QVariant hours = m_model->data(row, QStringLiteral("hours"), Qt::EditRole);
            if (!hours.isNull()) {
                m_totalHours += hours.toDouble();
                m_totalHoursValid = true;
            }
            const QVariant count = m_model->data(row, QStringLiteral("person_count"), Qt::EditRole);
            if (!count.isNull())
                m_totalPersons += count.toInt();
            const QString type =
                m_model->data(row, QStringLiteral("person_type"), Qt::EditRole).toString().trimmed();
            if (!type.isEmpty() && !types.contains(type))
                types << type;
        }
    }
    m_personTypes = types.join(QStringLiteral(", "));
    m_total->setText(m_totalHoursValid ? QLocale().toString(m_totalHours, 'f', 2) : QString());
}

void VDRTimeRecordingWidget::slot_addButtonClicked()
{
    if (!m_document || !m_document->appendEntryTimeRecording(m_entryId, m_workforceId))
        return;
    m_dirty = true;
    m_view->slotSetItemFocus(m_model->rowCount() - 1, m_model->fieldIndex(QStringLiteral("person_count")));
}

void VDRTimeRecordingWidget::slot_removeButtonClicked()
{
    m_dirty = true;
    slotCalculateTotalHours();
}

void VDRTimeRecordingWidget::storeSizes()
{
    QSettings settings;
    QList<int> widths;
    for (const char* column : kColumns)
        widths << m_view->columnWidth(m_view->getColumnIndex(column));
    QList<int> heights;
    for (int row = 0; row < m_model->rowCount(); ++row)
        heights << m_view->rowHeight(row);
    settings.setValue(ColumnsSettingsKey, toVariantList(widths));
    settings.setValue(RowsSettingsKey, toVariantList(heights));
    settings.setValue(WidthSettingsKey, width());
    settings.setValue(HeightSettingsKey, height());
}

void VDRTimeRecordingWidget::accept()
{
    if (m_model) {
        storeSizes();
        m_model->submitAll();
        slotCalculateTotalHours();
    }
    m_dirty = false;
    QDialog::accept();
}

void VDRTimeRecordingWidget::reject()
{
    if (m_dirty && VDRPrompt::instance()->question(VDRPrompt::Question, tr("Änderungen verwerfen"),
                                                   tr("Sollen die Änderungen verworfen werden?"),
                                                   VDRPrompt::Ok | VDRPrompt::Abort, VDRPrompt::Ok,
                                                   VDRPrompt::Abort) != VDRPrompt::Ok)
        return;
    if (m_model)
        m_model->revertAll();
    m_dirty = false;
    slotCalculateTotalHours();
    QDialog::reject();
}

int VDRTimeRecordingWidget::editWorkforceRow(VDRDocument* document, int entryId, int workforceId,
                                             QWidget* parent)
{
    if (!document)
        return 0;
    VDRDocument::EntryModelsPin pin(document, entryId);
    VDRTimeRecordingWidget dialog(parent);
    dialog.setDocument(document);
    dialog.setEntryID(entryId);
    dialog.setWorkforceID(workforceId);
    const int result = dialog.exec();
    if (result == 1)
        dialog.writeWorkforceRow();
    return result;
}

void VDRTimeRecordingWidget::writeWorkforceRow()
{
    VDRSqlTableModel* workforce = m_document ? m_document->modelEntryWorkforce(m_entryId) : nullptr;
    if (!workforce)
        return;
    workforce->setDataById(m_workforceId, QStringLiteral("person_count"), totalPersonCount());
    workforce->setDataById(m_workforceId, QStringLiteral("man_hours"),
                           totalHoursIsValid() ? QVariant(totalHours()) : QVariant(QVariant::Double));
    workforce->setDataById(m_workforceId, QStringLiteral("person_type"), personTypes());
}
