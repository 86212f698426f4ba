#pragma once

#include "document/VDRSqlTableModel.h"

#include <QDialog>
#include <QList>
#include <QPointer>

class QLineEdit;
class VDRDocument;
class VDRTableView;

// The persons and working times behind one workforce row; on OK their totals go into the row.
class VDRTimeRecordingWidget : public QDialog
{
    Q_OBJECT
public:
    static const QString ColumnsSettingsKey; // "TimeRecordingWidget/colums"
    static const QString RowsSettingsKey;    // "TimeRecordingWidget/rows"
    static const QString WidthSettingsKey;   // "TimeRecordingWidget/width"
    static const QString HeightSettingsKey;  // "TimeRecordingWidget/height"

    explicit VDRTimeRecordingWidget(QWidget* parent = nullptr);
    ~VDRTimeRecordingWidget() override;

    void setDocument(VDRDocument* document) { m_document = document; }
    void setEntryID(int entryId) { m_entryId = entryId; }
    void setWorkforceID(int workforceId) { m_workforceId = workforceId; }
    void setModel(VDRSqlTableModel* model) { m_model = model; }
    // Sets the dialog up for its rows; false without a document or report.
    bool prepare();
    // 1 for OK, 0 otherwise.
    int exec() override;

    int totalPersonCount() const { return m_totalPersons; }
    double totalHours() const { return m_totalHours; }
    bool totalHoursIsValid() const { return m_totalHoursValid; }
    QString personTypes() const { return m_personTypes; }
    bool isDirty() const { return m_dirty; }
    VDRTableView* view() const { return m_view; }
    QLineEdit* totalField() const { return m_total; }

    // Writes the totals into the workforce row (after OK).
    void writeWorkforceRow();
    // Opens the dialog for a workforce row and, on OK, writes the totals into it. Returns exec's result.
    static int editWorkforceRow(VDRDocument* document, int entryId, int workforceId, QWidget* parent);

public slots:
    void slot_addButtonClicked();
    void slot_removeButtonClicked();
    void slotHoursChangedByUser(const QModelIndex& index);
    void slotUpdateHours(const QModelIndex& index, bool valid);
    void slotCalculateTotalHours();
    void accept() override;
    void reject() override;

private slots:
    void dataChangedHandler(const QModelIndex& topLeft, const QModelIndex& bottomRight);

private:
    void calculateHours(int row);
    bool isRemoved(int row) const;
    void storeSizes();
    void restoreFilter();

    VDRDocument* m_document = nullptr;
    QPointer<VDRSqlTableModel> m_model;
    int m_entryId = 0;
    int m_workforceId = 0;
    VDRTableView* m_view;
    QLineEdit* m_total;
    double m_totalHours = 0;
    bool m_totalHoursValid = false;
    int m_totalPersons = 0;
    QString m_personTypes;
    bool m_dirty = false;
    bool m_prepared = false;
    QString m_previousFilter;
    QList<QMetaObject::Connection> m_connections;
};
