#include "editing/reportlist/VDREntryListWidget.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "editing/form/VdEvent.h"
#include "editing/form/VdEventsController.h"

#include <QHeaderView>
#include <QKeyEvent>
#include <QMenu>
#include <QMetaMethod>
#include <QMouseEvent>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTableView>
#include <QVBoxLayout>

// Only what the user does with the mouse or the keys navigates: the current row also moves when
// the form adds or removes reports, and the form chooses the report to show itself then.
class VDREntryListWidget::TableView : public QTableView
{
public:
    using QTableView::QTableView;
    bool byUser = false;

protected:
    void mousePressEvent(QMouseEvent* event) override
    {
        byUser = true;
        QTableView::mousePressEvent(event);
        byUser = false;
    }
    void keyPressEvent(QKeyEvent* event) override
    {
        byUser = true;
        QTableView::keyPressEvent(event);
        byUser = false;
    }
};

VDREntryListWidget::VDREntryListWidget(QWidget* parent) : QWidget(parent), m_view(new TableView(this))
{
    setObjectName(QStringLiteral("VDREntryListWidget"));
    auto* layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->addWidget(m_view);
    m_view->setObjectName(QStringLiteral("tableViewEntriesAll"));
    m_view->setEditTriggers(QAbstractItemView::NoEditTriggers);
    m_view->setSelectionBehavior(QAbstractItemView::SelectRows);
    m_view->setSelectionMode(QAbstractItemView::SingleSelection);
    m_view->verticalHeader()->hide();
    m_view->setContextMenuPolicy(Qt::CustomContextMenu);
    connect(m_view, &QWidget::customContextMenuRequested, this, [this](const QPoint& pos) {
        const QModelIndex index = m_view->indexAt(pos);
        if (!index.isValid())
            return;
        QMenu* menu = createContextMenu(index.row(), this);
        menu->setAttribute(Qt::WA_DeleteOnClose);
        menu->popup(m_view->viewport()->mapToGlobal(pos));
    });
    VdEventsController::instance()->registerEvent(this, VdEvent::EntryListRowChanged);
    VdEventsController::instance()->registerEvent(this, VdEvent::SelectRow);
}

VDREntryListWidget::~VDREntryListWidget()
{
    VdEventsController::instance()->unregisterReceiver(this);
}

QTableView* VDREntryListWidget::tableView() const
{
    return m_view;
}

void VDREntryListWidget::slotDocumentOpened(VDRDocument* document)
{
    m_document = document;
    m_currentRow = -1;
    VDRAllEntryTableModel* model = document ? document->modelEntryAll() : nullptr;
    m_view->setModel(model);
    if (!model)
        return;
    const QSqlRecord record = model->record();
    for (int c = 0; c < record.count(); ++c) {
        const QString field = record.fieldName(c);
        m_view->setColumnHidden(c, field != QLatin1String("number") &&
                                       field != QLatin1String("inspection_date"));
    }
    model->setHeaderData(QStringLiteral("number"), Qt::Horizontal, tr("Nr."));
    model->setHeaderData(QStringLiteral("inspection_date"), Qt::Horizontal, tr("Datum"));
    model->setHeaderData(QStringLiteral("user_id"), Qt::Horizontal, tr("Autor"));
    slotShowUserIds();
    m_view->resizeColumnsToContents();
    m_view->horizontalHeader()->setStretchLastSection(true);
    connect(m_view->selectionModel(), &QItemSelectionModel::currentRowChanged, this,
            [this](const QModelIndex& current) {
                if (m_view->byUser && current.isValid() && current.row() != m_currentRow)
                    userChoseRow(current.row());
            });
}

void VDREntryListWidget::slotDocumentClosed(VDRDocument*)
{
    m_view->setModel(nullptr);
    m_document = nullptr;
    m_currentRow = -1;
}

void VDREntryListWidget::slotShowUserIds()
{
    if (!m_document || !m_view->model())
        return;
    const int column = m_document->modelEntryAll()->fieldIndex(QStringLiteral("user_id"));
    if (column < 0)
        return;
    // SQLite answers at once; the list may not have fetched every report yet.
    QSqlQuery q(m_document->database());
    const bool used =
        q.exec(QStringLiteral("SELECT 1 FROM entry WHERE trim(ifnull(user_id, '')) <> '' LIMIT 1")) &&
        q.next();
    m_view->setColumnHidden(column, !used);
}

void VDREntryListWidget::userChoseRow(int row)
{
    VdEventsController* events = VdEventsController::instance();
    const int previousId = entryId(m_currentRow);
    if (previousId > 0)
        events->send_event(VdEvent::SaveMetrics, previousId);
    m_currentRow = row;
    events->send_event(VdEvent::GotoRow, row);
    const QDate date = QDate::fromString(
        m_document->modelEntryAll()->data(row, QStringLiteral("inspection_date"), Qt::EditRole).toString(),
        QStringLiteral("yyyy-MM-dd"));
    if (date.isValid())
        emit dateSelected(date);
    events->send_event(VdEvent::RestoreMetrics, entryId(row));
}

void VDREntryListWidget::selectRow(int row)
{
    QAbstractItemModel* model = m_view->model();
    if (!model || !m_document)
        return;
    if (row < 0 || row >= model->rowCount()) {
        m_currentRow = -1;
        m_view->clearSelection();
        return;
    }
    m_currentRow = row;
    m_view->selectRow(row);
    // The row shown decides what the list's commands may do, as the form's own notice (1002) does.
    if (isLocked(row))
        emit rowChangedToLockedEntry();
    else
        emit rowChangedToUnlockedEntry();
    m_view->scrollTo(model->index(row, m_document->modelEntryAll()->fieldIndex(QStringLiteral("number"))));
    const QDate date = QDate::fromString(
        m_document->modelEntryAll()->data(row, QStringLiteral("inspection_date"), Qt::EditRole).toString(),
        QStringLiteral("yyyy-MM-dd"));
    if (date.isValid())
        emit dateSelected(date);
}

void VDREntryListWidget::customEvent(QEvent* event)
{
    auto* vdEvent = dynamic_cast<VdEvent*>(event);
    if (!vdEvent)
        return QWidget::customEvent(event);
    if (vdEvent->number() == VdEvent::SelectRow) {
        selectRow(vdEvent->arg(0).toInt());
    } else if (vdEvent->number() == VdEvent::EntryListRowChanged) {
        const int row = vdEvent->arg(0).toInt();
        m_currentRow = row;
        if (m_document && row >= 0) {
            if (isLocked(row))
                emit rowChangedToLockedEntry();
            else
                emit rowChangedToUnlockedEntry();
        }
    }
}

QMenu* VDREntryListWidget::createContextMenu(int row, QWidget* parent)
{
    auto* menu = new QMenu(parent);
    menu->setObjectName(QStringLiteral("menuEntryList"));
    const bool locked = isLocked(row);
    const struct
    {
        const char* name;
        QString text;
        void (VDREntryListWidget::*signal)(int);
        bool enabled;
    } items[] = {
        {"actionEntryAllAlterNumber", tr("Nummer ändern"), &VDREntryListWidget::doEntryAllAlterNumber,
         !locked},
        {"actionEntryAllPrint", tr("Drucken"), &VDREntryListWidget::doEntryAllPrint, true},
        {"actionEntryAllPdf", tr("PDF speichern"), &VDREntryListWidget::doEntryAllPdf, true},
        {"actionEntryAllCopy", tr("Kopieren"), &VDREntryListWidget::doEntryAllCopy, true},
        // The main window's switch speaks for the shown report; any other row is judged by itself.
        {"actionEntryAllDelete", tr("Löschen"), &VDREntryListWidget::doEntryAllDelete,
         !locked && (row != m_currentRow || m_deleteEnabled)},
        {"actionEntryAllMail", tr("Per E-Mail versenden"), &VDREntryListWidget::doEntryAllMail, true},
        {"actionEntryAllChangeUID", tr("Autor ändern"), &VDREntryListWidget::doEntryAllChangeUID, true},
    };
    for (const auto& item : items) {
        QAction* action = menu->addAction(item.text);
        action->setObjectName(QLatin1String(item.name));
        // A command whose window part is not there yet stays visible but off.
        const bool connected = isSignalConnected(QMetaMethod::fromSignal(item.signal));
        action->setEnabled(item.enabled && connected);
        if (!connected)
            action->setToolTip(tr("%1 (noch nicht verfügbar)").arg(item.text));
        const auto signal = item.signal;
        connect(action, &QAction::triggered, this, [this, signal, row] { emit(this->*signal)(row); });
    }
    menu->setToolTipsVisible(true);
    return menu;
}

bool VDREntryListWidget::isLocked(int row) const
{
    return m_document && row >= 0 &&
           m_document->modelEntryAll()->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0;
}

int VDREntryListWidget::entryId(int row) const
{
    if (!m_document || row < 0 || row >= m_document->modelEntryAll()->rowCount())
        return -1;
    return m_document->modelEntryAll()->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
}
