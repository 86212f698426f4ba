#pragma once

#include <QHash>
#include <QMap>
#include <QPair>
#include <QPointer>
#include <QTableView>

class QLabel;
class QToolButton;
class VDRItemDelegate;
class VDRSqlTableModel;

// The table view of every report list and company list: add, remove and enlarge buttons, column
// widths in pixels or shares, per-report column widths and row heights, click shortcuts.
class VDRTableView : public QTableView
{
    Q_OBJECT
public:
    enum COLUMNWIDTH_TYPE
    {
        CWT_PIXEL = 0,
        CWT_MINIMUM = 1,
        CWT_PERCENT = 2
    };

    explicit VDRTableView(QWidget* parent = nullptr);
    ~VDRTableView() override;

    // Also installs the delegate the model builds for its columns.
    void setModel(QAbstractItemModel* model) override;
    VDRSqlTableModel* vdrModel() const;
    VDRItemDelegate* vdrDelegate() const;

    void setButtonAddVisible(bool visible);
    void setButtonDeleteVisible(bool visible);
    void setButtonBigviewVisible(bool visible);
    QToolButton* buttonAdd() const { return m_buttonAdd; }
    QToolButton* buttonDelete() const { return m_buttonDelete; }
    QToolButton* buttonBigview() const { return m_buttonBigview; }
    QLabel* hintLabel() const { return m_hint; }

    void setFlagAutodelete(bool autodelete) { m_autodelete = autodelete; }
    bool flagAutodelete() const { return m_autodelete; }
    void setSaveMetricsFlag(bool save) { m_saveMetrics = save; }
    bool saveMetricsFlag() const { return m_saveMetrics; }

    void setColumnWidth(const QString& column, COLUMNWIDTH_TYPE type, int value);
    void setColumnWidth(int column, COLUMNWIDTH_TYPE type, int value);
    QMap<int, QPair<COLUMNWIDTH_TYPE, int>> columnWidths() const { return m_columnWidths; }
    void setColumnWidths(const QMap<int, QPair<COLUMNWIDTH_TYPE, int>>& widths) { m_columnWidths = widths; }
    void setAllColumnsHidden();
    void setColumnHidden(const QString& column, bool hide);
    void setColumnHidden(int column, bool hide);
    int getColumnIndex(const char* column) const;
    void resizeColumns();
    void set_current_row(int row);
    // false switches the editors and drag and drop off (a locked report), true on again.
    void disable_editors(bool enable);
    bool editorsEnabled() const { return m_editorsEnabled; }
    void save_metrics(int entryId);
    void restore_metrics(int entryId);
    bool hasMetrics(int entryId) const { return m_metrics.contains(entryId); }
    void sortByColumn(int column);
    void set_sort_order(int column, Qt::SortOrder order);

public slots:
    void slotSetItemFocus(int row, int column);
    void slotSetItemFocusIndex(const QModelIndex& index);
    void slotButtonDeleteClicked();
    void slotButtonBigviewClicked();

signals:
    void signalButtonAddClicked();
    void signalButtonDeleteClicked();
    void mouseClick4TimeRecording(int row, int id, int entryId);
    void mouseClick4DeficienyImageDialog(int row, int id, int entryId);

protected:
    bool event(QEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    void showEvent(QShowEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseDoubleClickEvent(QMouseEvent* event) override;
    void startDrag(Qt::DropActions supportedActions) override;
    void dragEnterEvent(QDragEnterEvent* event) override;
    void dropEvent(QDropEvent* event) override;

private slots:
    void updateHint();
    void updateRemovedRows();

private:
    void placeButtons();
    bool isOnTable(const char* table) const;
    // The rows of the other models that go with a removed row.
    void removeDependents(VDRSqlTableModel* model, int row);

    QToolButton* m_buttonAdd;
    QToolButton* m_buttonDelete;
    QToolButton* m_buttonBigview;
    QLabel* m_hint;
    QPointer<QAbstractItemModel> m_model;
    bool m_autodelete = false;
    bool m_saveMetrics = false;
    bool m_editorsEnabled = true;
    QMap<int, QPair<COLUMNWIDTH_TYPE, int>> m_columnWidths;
    // Per report id: column widths and row heights.
    QHash<int, QPair<QMap<int, int>, QMap<int, int>>> m_metrics;
};
