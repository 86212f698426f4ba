#include "editing/tables/VDRTableViewDialog.h"

#include "document/VDRSqlTableModel.h"
#include "editing/tables/VDRTableView.h"
#include "editing/time/VDRTimeRecordingWidget.h"

#include <QDialogButtonBox>
#include <QPushButton>
#include <QToolButton>
#include <QVBoxLayout>

VDRTableViewDialog::VDRTableViewDialog(VDRTableView* smallView, QWidget* parent)
    : QDialog(parent), m_small(smallView), m_view(new VDRTableView(this))
{
    setModal(true);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(m_view);
    auto* buttons = new QDialogButtonBox(QDialogButtonBox::Close, this);
    buttons->button(QDialogButtonBox::Close)->setText(tr("Schließen"));
    layout->addWidget(buttons);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    resize(1000, 600);
    if (!smallView)
        return;
    setWindowTitle(smallView->model() ? smallView->model()->objectName() : QString());
    m_view->setModel(smallView->model());
    m_view->setItemDelegate(smallView->itemDelegate());
    if (smallView->model()) {
        for (int column = 0; column < smallView->model()->columnCount(); ++column)
            m_view->setColumnHidden(column, smallView->isColumnHidden(column));
    }
    m_view->setColumnWidths(smallView->columnWidths());
    m_view->setFlagAutodelete(smallView->flagAutodelete());
    m_view->setButtonAddVisible(!smallView->buttonAdd()->isHidden());
    m_view->setButtonDeleteVisible(!smallView->buttonDelete()->isHidden());
    m_view->setButtonBigviewVisible(false);
    m_view->disable_editors(smallView->editorsEnabled());
    m_view->setDragDropMode(smallView->dragDropMode());
    m_view->setSelectionMode(smallView->selectionMode());
    m_view->setEditTriggers(smallView->editTriggers());
    connect(m_view, &VDRTableView::signalButtonAddClicked, smallView, &VDRTableView::signalButtonAddClicked);
    connect(m_view, &VDRTableView::signalButtonDeleteClicked, smallView,
            &VDRTableView::signalButtonDeleteClicked);
    connect(m_view, &VDRTableView::mouseClick4TimeRecording, this,
            &VDRTableViewDialog::slot_startTimeRecording);
    connect(m_view, &VDRTableView::mouseClick4DeficienyImageDialog, this,
            &VDRTableViewDialog::slot_entrydataDfcy_startImageAssignDialog);
}

void VDRTableViewDialog::slot_startTimeRecording(int row, int id, int entryId)
{
    Q_UNUSED(row)
    VDRSqlTableModel* model = m_view->vdrModel();
    if (model)
        VDRTimeRecordingWidget::editWorkforceRow(model->getDocument(), entryId, id, this);
}

void VDRTableViewDialog::slot_entrydataDfcy_startImageAssignDialog(int row, int id, int entryId)
{
    // The report form owns the image assignment; the small view's signal reaches it.
    if (m_small)
        emit m_small->mouseClick4DeficienyImageDialog(row, id, entryId);
}
