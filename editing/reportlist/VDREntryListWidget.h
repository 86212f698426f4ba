#pragma once

#include <QDate>
#include <QWidget>

class QMenu;
class QModelIndex;
class QTableView;
class VDRDocument;

// The report list dock: every report of the diary with its number, date and (when the diary uses
// them) author code. Choosing a row asks the report form to show it; a right click offers the
// commands on that report.
class VDREntryListWidget : public QWidget
{
    Q_OBJECT
public:
    explicit VDREntryListWidget(QWidget* parent = nullptr);
    ~VDREntryListWidget() override;

    QTableView* tableView() const;
    // The row the list knows as shown (-1 for none).
    int currentRow() const { return m_currentRow; }
    // The context menu of a row, as a right click shows it.
    QMenu* createContextMenu(int row, QWidget* parent);
    bool isDeleteEnabled() const { return m_deleteEnabled; }
    void setDeleteEnabled(bool enabled) { m_deleteEnabled = enabled; }

public slots:
    void slotDocumentOpened(VDRDocument* document);
    void slotDocumentClosed(VDRDocument* document);
    // Shows the author column when any report carries an author code.
    void slotShowUserIds();
    // Selects a row without asking the form to show it (the form already does).
    void selectRow(int row);

signals:
    void dateSelected(QDate date);
    void rowChangedToLockedEntry();
    void rowChangedToUnlockedEntry();
    void doEntryAllAlterNumber(int row);
    void doEntryAllPrint(int row);
    void doEntryAllPdf(int row);
    void doEntryAllCopy(int row);
    void doEntryAllDelete(int row);
    void doEntryAllMail(int row);
    void doEntryAllChangeUID(int row);

protected:
    void customEvent(QEvent* event) override;

private:
    class TableView;
    void userChoseRow(int row);
    bool isLocked(int row) const;
    int entryId(int row) const;

    TableView* m_view;
    VDRDocument* m_document = nullptr;
    int m_currentRow = -1;
    bool m_deleteEnabled = true;
};
