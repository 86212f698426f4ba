#include "editing/tables/VDRTableView.h"

#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRPrompt.h"
#include "document/VDRSqlTableModel.h"
#include "editing/form/VdEvent.h"
#include "editing/form/VdEventsController.h"
#include "editing/tables/VDRItemDelegate.h"
#include "editing/tables/VDRTableViewDialog.h"

#include <QDrag>
#include <QDragEnterEvent>
#include <QDropEvent>
#include <QFileInfo>
#include <QHeaderView>
#include <QLabel>
#include <QMimeData>
#include <QMouseEvent>
#include <QScrollBar>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlRecord>
#include <QToolButton>

#include <algorithm>

namespace {
QToolButton* makeButton(QWidget* parent, const QString& icon, const QString& fallback, const QString& toolTip)
{
    auto* button = new QToolButton(parent);
    const QIcon image(icon);
    if (image.availableSizes().isEmpty())
        button->setText(fallback);
    else
        button->setIcon(image);
    button->setToolTip(toolTip);
    button->setAutoRaise(true);
    button->setFocusPolicy(Qt::NoFocus);
    button->setFixedSize(18, 18);
    return button;
}
} // namespace

VDRTableView::VDRTableView(QWidget* parent)
    : QTableView(parent),
      m_buttonAdd(makeButton(this, QStringLiteral(":/VDRMainWindow/Resources/icon-tableview-plus.png"),
                             QStringLiteral("+"), tr("Eintrag hinzufügen"))),
      m_buttonDelete(makeButton(this, QStringLiteral(":/VDRMainWindow/Resources/icon-tableview-minus.png"),
                                QStringLiteral("−"), tr("Eintrag entfernen"))),
      m_buttonBigview(makeButton(this, QStringLiteral(":/VDRMainWindow/Resources/icon-tableview-zoom1.png"),
                                 QStringLiteral("⤢"), tr("Tabelle vergrößern"))),
      m_hint(new QLabel(tr("Doppelklick für neue Zeile"), viewport()))
{
    VDRItemDelegate::installFactory();
    m_hint->setStyleSheet(QStringLiteral("QLabel {color:rgb(154,152,150);}"));
    m_hint->setAttribute(Qt::WA_TransparentForMouseEvents);
    setSelectionBehavior(QAbstractItemView::SelectRows);
    setSelectionMode(QAbstractItemView::ExtendedSelection);
    setEditTriggers(QAbstractItemView::DoubleClicked | QAbstractItemView::SelectedClicked |
                    QAbstractItemView::EditKeyPressed | QAbstractItemView::AnyKeyPressed);
    setDragDropMode(QAbstractItemView::DragDrop);
    setDefaultDropAction(Qt::MoveAction);
    setDragDropOverwriteMode(false);
    setDropIndicatorShown(true);
    setWordWrap(true);
    connect(m_buttonAdd, &QToolButton::clicked, this, &VDRTableView::signalButtonAddClicked);
    connect(m_buttonDelete, &QToolButton::clicked, this, &VDRTableView::slotButtonDeleteClicked);
    connect(m_buttonBigview, &QToolButton::clicked, this, &VDRTableView::slotButtonBigviewClicked);
    for (int number :
         {VdEvent::SelectRow, VdEvent::EnableEditors, VdEvent::SaveMetrics, VdEvent::RestoreMetrics})
        VdEventsController::instance()->registerEvent(this, number);
    updateHint();
}

VDRTableView::~VDRTableView()
{
    VdEventsController::instance()->unregisterReceiver(this);
}

void VDRTableView::setModel(QAbstractItemModel* model)
{
    if (m_model)
        disconnect(m_model, nullptr, this, nullptr);
    QAbstractItemDelegate* oldDelegate = itemDelegate();
    QTableView::setModel(model);
    m_model = model;
    if (VDRSqlTableModel* sql = vdrModel()) {
        if (auto* delegate =
                qobject_cast<VDRItemDelegate*>(sql->createItemDelegate(this, -1, m_editorsEnabled)))
            setItemDelegate(delegate);
        connect(sql, &VDRSqlTableModel::setItemFocus, this, &VDRTableView::slotSetItemFocusIndex);
    }
    if (oldDelegate && oldDelegate != itemDelegate() && oldDelegate->parent() == this)
        oldDelegate->deleteLater();
    if (model) {
        connect(model, &QAbstractItemModel::rowsInserted, this, &VDRTableView::updateHint);
        connect(model, &QAbstractItemModel::rowsRemoved, this, &VDRTableView::updateHint);
        connect(model, &QAbstractItemModel::modelReset, this, &VDRTableView::updateHint);
        connect(model, &QAbstractItemModel::layoutChanged, this, &VDRTableView::updateHint);
        connect(model, &QAbstractItemModel::headerDataChanged, this, &VDRTableView::updateRemovedRows);
        connect(model, &QAbstractItemModel::modelReset, this, &VDRTableView::updateRemovedRows);
    }
    updateHint();
}

VDRSqlTableModel* VDRTableView::vdrModel() const
{
    return qobject_cast<VDRSqlTableModel*>(model());
}

VDRItemDelegate* VDRTableView::vdrDelegate() const
{
    return qobject_cast<VDRItemDelegate*>(itemDelegate());
}

void VDRTableView::setButtonAddVisible(bool visible)
{
    m_buttonAdd->setVisible(visible);
    placeButtons();
}

void VDRTableView::setButtonDeleteVisible(bool visible)
{
    m_buttonDelete->setVisible(visible);
    placeButtons();
}

void VDRTableView::setButtonBigviewVisible(bool visible)
{
    m_buttonBigview->setVisible(visible);
    placeButtons();
}

void VDRTableView::placeButtons()
{
    // Bottom right, above the scroll bar.
    int x = viewport()->geometry().right() - 2;
    const int y = viewport()->geometry().bottom() - 20;
    for (QToolButton* button : {m_buttonBigview, m_buttonDelete, m_buttonAdd}) {
        if (button->isHidden())
            continue;
        x -= button->width();
        button->move(x, y);
        button->raise();
        x -= 2;
    }
}

void VDRTableView::updateRemovedRows()
{
    // Removed rows stay in the model, marked, until it is submitted or reverted.
    if (!model())
        return;
    for (int row = 0; row < model()->rowCount(); ++row) {
        const bool removed = model()->headerData(row, Qt::Vertical).toString() == QLatin1String("!");
        if (isRowHidden(row) != removed)
            setRowHidden(row, removed);
    }
}

void VDRTableView::updateHint()
{
    const bool empty = !model() || model()->rowCount() == 0;
    m_hint->setVisible(empty && !isOnTable("entry"));
    m_hint->adjustSize();
    m_hint->move((viewport()->width() - m_hint->width()) / 2, (viewport()->height() - m_hint->height()) / 2);
    verticalHeader()->setVisible(!empty);
}

bool VDRTableView::isOnTable(const char* table) const
{
    VDRSqlTableModel* sql = vdrModel();
    return sql && VDRSqlTableModel::sqlTableName(sql->tableNameId()) == QLatin1String(table);
}

void VDRTableView::setColumnWidth(const QString& column, COLUMNWIDTH_TYPE type, int value)
{
    if (VDRSqlTableModel* sql = vdrModel())
        setColumnWidth(sql->fieldIndex(column), type, value);
}

void VDRTableView::setColumnWidth(int column, COLUMNWIDTH_TYPE type, int value)
{
    if (column >= 0)
        m_columnWidths.insert(column, qMakePair(type, value));
}

void VDRTableView::setAllColumnsHidden()
{
    if (!model())
        return;
    for (int column = 0; column < model()->columnCount(); ++column)
        QTableView::setColumnHidden(column, true);
}

void VDRTableView::setColumnHidden(const QString& column, bool hide)
{
    if (VDRSqlTableModel* sql = vdrModel())
        setColumnHidden(sql->fieldIndex(column), hide);
}

void VDRTableView::setColumnHidden(int column, bool hide)
{
    if (column >= 0)
        QTableView::setColumnHidden(column, hide);
}

int VDRTableView::getColumnIndex(const char* column) const
{
    VDRSqlTableModel* sql = vdrModel();
    return sql ? sql->fieldIndex(QLatin1String(column)) : -1;
}

void VDRTableView::resizeColumns()
{
    if (!model())
        return;
    updateHint();
    // The viewport already leaves out the vertical header and the scroll bar.
    int available = viewport()->width();
    const int minimum = horizontalHeader()->minimumSectionSize();
    for (int column = 0; column < model()->columnCount(); ++column) {
        if (isColumnHidden(column))
            continue;
        const auto it = m_columnWidths.constFind(column);
        if (it == m_columnWidths.constEnd() || it->first == CWT_MINIMUM) {
            QTableView::setColumnWidth(column, minimum);
            available -= minimum;
        } else if (it->first == CWT_PIXEL) {
            QTableView::setColumnWidth(column, it->second);
            available -= it->second;
        }
    }
    available = std::max(0, available);
    for (auto it = m_columnWidths.constBegin(); it != m_columnWidths.constEnd(); ++it) {
        if (it->first == CWT_PERCENT && !isColumnHidden(it.key()) && it.key() < model()->columnCount())
            QTableView::setColumnWidth(it.key(), it->second * available / 100);
    }
}

void VDRTableView::set_current_row(int row)
{
    if (!model() || row < 0 || row >= model()->rowCount())
        return;
    selectRow(row);
    int column = 0;
    while (column < model()->columnCount() && isColumnHidden(column))
        ++column;
    setCurrentIndex(model()->index(row, column < model()->columnCount() ? column : 0));
}

void VDRTableView::disable_editors(bool enable)
{
    m_editorsEnabled = enable;
    if (VDRItemDelegate* delegate = vdrDelegate())
        delegate->setEditorsEnabled(enable);
    if (!enable && state() == QAbstractItemView::EditingState) {
        if (QWidget* editor = indexWidget(currentIndex()))
            closeEditor(editor, QAbstractItemDelegate::RevertModelCache);
    }
    setDragDropMode(enable ? QAbstractItemView::DragDrop : QAbstractItemView::NoDragDrop);
    setAcceptDrops(enable);
    m_buttonAdd->setEnabled(enable);
    m_buttonDelete->setEnabled(enable);
}

void VDRTableView::save_metrics(int entryId)
{
    if (!model())
        return;
    QMap<int, int> widths;
    QMap<int, int> heights;
    for (int column = 0; column < model()->columnCount(); ++column)
        widths.insert(column, columnWidth(column));
    for (int row = 0; row < model()->rowCount(); ++row)
        heights.insert(row, rowHeight(row));
    m_metrics.insert(entryId, qMakePair(widths, heights));
}

void VDRTableView::restore_metrics(int entryId)
{
    const auto it = m_metrics.constFind(entryId);
    if (it == m_metrics.constEnd() || !model())
        return;
    for (auto w = it->first.constBegin(); w != it->first.constEnd(); ++w) {
        if (w.key() < model()->columnCount())
            QTableView::setColumnWidth(w.key(), w.value());
    }
    for (auto h = it->second.constBegin(); h != it->second.constEnd(); ++h) {
        if (h.key() < model()->rowCount())
            setRowHeight(h.key(), h.value());
    }
}

void VDRTableView::sortByColumn(int column)
{
    QTableView::sortByColumn(column, horizontalHeader()->sortIndicatorOrder());
}

void VDRTableView::set_sort_order(int column, Qt::SortOrder order)
{
    horizontalHeader()->setSortIndicator(column, order);
    QTableView::sortByColumn(column, order);
}

void VDRTableView::slotSetItemFocus(int row, int column)
{
    if (!model() || row < 0 || row >= model()->rowCount())
        return;
    // A hidden column (the id, say) gives way to the first shown one.
    column = std::max(0, column);
    if (isColumnHidden(column)) {
        column = 0;
        while (column < model()->columnCount() - 1 && isColumnHidden(column))
            ++column;
    }
    const QModelIndex index = model()->index(row, column);
    setCurrentIndex(index);
    scrollTo(index);
    setFocus();
}

void VDRTableView::slotSetItemFocusIndex(const QModelIndex& index)
{
    if (index.isValid() && index.model() == model())
        slotSetItemFocus(index.row(), index.column());
}

bool VDRTableView::event(QEvent* event)
{
    switch (int(event->type())) {
    case VdEvent::SelectRow:
        // The row is one of the report list; the lists of a report keep their selection.
        if (isOnTable("entry"))
            set_current_row(static_cast<VdEvent*>(event)->arg(0).toInt());
        return true;
    case VdEvent::EnableEditors:
        // Only the lists of a report follow its lock; master-data lists stay editable.
        if (vdrModel() && vdrModel()->entryId() > 0)
            disable_editors(static_cast<VdEvent*>(event)->arg(0).toBool());
        return true;
    case VdEvent::SaveMetrics:
        if (m_saveMetrics && !isOnTable("entry"))
            save_metrics(static_cast<VdEvent*>(event)->arg(0).toInt());
        return true;
    case VdEvent::RestoreMetrics:
        if (!isOnTable("entry"))
            restore_metrics(static_cast<VdEvent*>(event)->arg(0).toInt());
        return true;
    default:
        return QTableView::event(event);
    }
}

void VDRTableView::resizeEvent(QResizeEvent* event)
{
    QTableView::resizeEvent(event);
    resizeColumns();
    placeButtons();
}

void VDRTableView::showEvent(QShowEvent* event)
{
    QTableView::showEvent(event);
    resizeColumns();
    placeButtons();
}

void VDRTableView::mousePressEvent(QMouseEvent* event)
{
    VDRSqlTableModel* sql = vdrModel();
    const QModelIndex index = indexAt(event->pos());
    if (event->button() == Qt::LeftButton && sql && index.isValid()) {
        const QString field = sql->record().fieldName(index.column());
        const int id = sql->data(index.row(), QStringLiteral("id"), Qt::EditRole).toInt();
        const int entryId = sql->data(index.row(), QStringLiteral("entry_id"), Qt::EditRole).toInt();
        if (sql->tableNameId() == VDRSqlTableModel::TN_WORKFORCE &&
            (field == QLatin1String("person_count") || field == QLatin1String("person_type") ||
             field == QLatin1String("man_hours"))) {
            set_current_row(index.row());
            emit mouseClick4TimeRecording(index.row(), id, entryId);
            return;
        }
        if (isOnTable("entry_progress") && field == QLatin1String("image_cnt") &&
            sql->data(index.row(), QStringLiteral("type"), Qt::EditRole).toInt() == 4) {
            set_current_row(index.row());
            emit mouseClick4DeficienyImageDialog(index.row(), id, entryId);
            return;
        }
    }
    QTableView::mousePressEvent(event);
}

void VDRTableView::mouseDoubleClickEvent(QMouseEvent* event)
{
    if (event->button() == Qt::LeftButton && !indexAt(event->pos()).isValid() && !isOnTable("entry")) {
        if (m_editorsEnabled && m_buttonAdd->isVisible())
            emit signalButtonAddClicked();
        return;
    }
    QTableView::mouseDoubleClickEvent(event);
}

void VDRTableView::startDrag(Qt::DropActions supportedActions)
{
    // The model moves the rows when they are dropped; nothing is removed here afterwards.
    Q_UNUSED(supportedActions)
    const QModelIndexList indexes =
        selectionModel() ? selectionModel()->selectedIndexes() : QModelIndexList();
    if (indexes.isEmpty() || !model())
        return;
    QMimeData* data = model()->mimeData(indexes);
    if (!data)
        return;
    auto* drag = new QDrag(this);
    drag->setMimeData(data);
    drag->exec(Qt::MoveAction, Qt::MoveAction);
}

void VDRTableView::dragEnterEvent(QDragEnterEvent* event)
{
    if (!m_editorsEnabled) {
        event->ignore();
        return;
    }
    QTableView::dragEnterEvent(event);
}

void VDRTableView::dropEvent(QDropEvent* event)
{
    if (!m_editorsEnabled) {
        event->ignore();
        return;
    }
    QTableView::dropEvent(event);
}

void VDRTableView::slotButtonDeleteClicked()
{
    if (!m_autodelete) {
        emit signalButtonDeleteClicked();
        return;
    }
    VDRSqlTableModel* sql = vdrModel();
    if (!sql || !selectionModel() || !m_editorsEnabled)
        return;
    QList<int> rows;
    for (const QModelIndex& index : selectionModel()->selectedIndexes()) {
        if (!rows.contains(index.row()))
            rows << index.row();
    }
    if (rows.isEmpty())
        return;
    if (VDRPrompt::instance()->question(VDRPrompt::Question, tr("Eintrag entfernen"),
                                        tr("Soll der gewählte Eintrag tatsächlich entfernt werden?"),
                                        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::Yes,
                                        VDRPrompt::No) != VDRPrompt::Yes)
        return;
    std::sort(rows.begin(), rows.end(), std::greater<int>());
    for (int row : qAsConst(rows)) {
        removeDependents(sql, row);
        sql->removeRows(row, 1);
    }
    clearSelection();
    emit signalButtonDeleteClicked();
}

void VDRTableView::removeDependents(VDRSqlTableModel* model, int row)
{
    VDRDocument* document = model->getDocument();
    if (!document)
        return;
    const int id = model->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    const int entryId = model->entryId();
    const QString table = VDRSqlTableModel::sqlTableName(model->tableNameId());
    if (model->tableNameId() == VDRSqlTableModel::TN_WORKFORCE) {
        if (VDRSqlTableModel* times = document->modelEntryTimeRecording(entryId)) {
            times->fetch_all();
            for (int r = times->rowCount() - 1; r >= 0; --r) {
                if (times->data(r, QStringLiteral("workforce_id"), Qt::EditRole).toInt() == id)
                    times->removeRows(r, 1);
            }
            times->submitAll();
        }
    } else if (table == QLatin1String("entry_progress")) {
        if (VDRSqlTableModel* photos = document->modelEntryPhoto2(entryId)) {
            photos->removeRelationsFromPhotoModel(id);
            photos->submitAll();
        }
        model->setData(row, QStringLiteral("image_cnt"), 0);
    } else if (table == QLatin1String("entry_scheduleddelivery") ||
               table == QLatin1String("entry_constructionmaterial")) {
        if (model->data(row, QStringLiteral("document"), Qt::EditRole).toString().trimmed().isEmpty())
            return;
        const QString path = VDRDocument::documentsDbPathFor(document->getFilepath());
        // A diary never saved has no documents database, and nothing to mark in it.
        if (document->getFilepath().isEmpty() || !QFileInfo(path).isFile())
            return;
        const QString connection = VDRDocumentsDb::connectionName();
        {
            QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), connection);
            db.setDatabaseName(path);
            if (!db.open()) {
                VDRPrompt::critical(tr("Datenbankfehler Dokumente-Datenbank"), db.lastError().driverText());
            } else {
                VDRDocumentsDb::setStatus4DocumentRecord(db, table, id, 2);
                db.close();
            }
        }
        QSqlDatabase::removeDatabase(connection);
    }
}

void VDRTableView::slotButtonBigviewClicked()
{
    VDRTableViewDialog dialog(this, window());
    dialog.exec();
    resizeColumns();
}
