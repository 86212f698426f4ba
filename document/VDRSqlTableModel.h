#pragma once

#include <QHash>
#include <QMap>
#include <QSqlTableModel>
#include <QStringList>
#include <QVariant>

#include <functional>

class QMimeData;
class VDRDocument;

// A table of the open diary: manual submission, addressed by field names and record ids.
class VDRSqlTableModel : public QSqlTableModel
{
    Q_OBJECT
public:
    enum TABLE_NAMES
    {
        TN_WORKFORCE = 0,
        TN_DELAY,
        TN_OBSTRUCTION,
        TN_DEFICIENCY,
        TN_ACCEPTANCE,
        TN_PHOTO_PROGRESS,
        TN_PHOTO_DEFICIENCY,
        TN_PHOTO_OBSTRUCTION,
        TN_DIRECTIVE,
        TN_AUXILIARY_SERVICE,
        TN_CONSTRUCTION_MEASURE,
        TN_CONSTRUCTION_MATERIAL,
        TN_SCHEDULED_DELIVERY,
        TN_META,
        TN_VDR,
        TN_ADDRESSLIST,
        TN_COMPANY1,
        TN_COMPANY2,
        TN_ADDRESSLIST_ITEM,
        TN_ATTENDEE,
        TN_TELEPHONE_NOTICE,
        TN_CONCERN,
        TN_ENTRY,
        TN_TIME_RECORDING,
        TN_EQUIPMENT,
        TN_PHOTO_MEASURE,
        TN_PHOTO_MATERIAL,
        TN_COUNT
    };
    Q_ENUM(TABLE_NAMES)

    // How the display role of a column is formatted; check-box columns also become user-checkable.
    enum DISPLAYROLE_TYPE
    {
        DRT_DEFAULT = 0,
        DRT_DATE,     // dd.MM.yyyy
        DRT_TIME,     // hh:mm
        DRT_HOURS,    // decimal hours, two places
        DRT_CHECKBOX, // 0/1 shown as a check box
        DRT_IMAGE,    // image id shown as thumbnail by the views
        DRT_COMPANY,  // company id shown in an output format by the views
    };
    Q_ENUM(DISPLAYROLE_TYPE)

    VDRSqlTableModel(TABLE_NAMES tableName, VDRDocument* document, QSqlDatabase db);

    static QString displayName(TABLE_NAMES tableName);
    static QString sqlTableName(TABLE_NAMES tableName);
    // The type condition of tables shared by several kinds of rows (0 = none).
    static int typeCondition(TABLE_NAMES tableName);
    TABLE_NAMES tableNameId() const { return m_tableName; }
    VDRDocument* getDocument() const { return m_document; }
    // New rows take their id from the diary's counter table (VDRDocument::sqlTableIdGenerator).
    void setGeneratesIds(bool generates) { m_generatesIds = generates; }
    bool generatesIds() const { return m_generatesIds; }

    void fetch_all();

    bool appendRow(const QHash<QString, QVariant>& values);
    bool insertRow(int row, const QHash<QString, QVariant>& values);
    using QSqlTableModel::insertRow;

    using QSqlTableModel::data;
    using QSqlTableModel::index;
    using QSqlTableModel::setData;
    using QSqlTableModel::setHeaderData;
    bool setData(int row, const QString& field, const QVariant& value, int role = Qt::EditRole);
    QVariant data(int row, const QString& field, int role = Qt::DisplayRole) const;
    QModelIndex index(int row, const QString& field) const;

    int rowById(int id);
    QModelIndex indexById(int id, const QString& field);
    bool setDataById(int id, const QString& field, const QVariant& value, int role = Qt::EditRole);
    QVariant dataById(int id, const QString& field, int role = Qt::DisplayRole);

    int last_id();
    int maxPos();
    // Row of the first record whose field holds the value, -1 when none.
    int record_position(const QString& field, const QVariant& value);

    // After submitting, the whole table is read again only when that can change what the model
    // shows: rows removed or inserted in the middle, or a filter or sort order that a changed row
    // may no longer fit. Otherwise only the appended rows are read back (for SQLite's defaults).
    bool submitAll();
    bool select() override;
    void revertRow(int row) override;
    bool insertRows(int row, int count, const QModelIndex& parent = QModelIndex()) override;
    bool removeRows(int row, int count, const QModelIndex& parent = QModelIndex()) override;
    int rowCount(const QModelIndex& parent = QModelIndex()) const override;
    void clear() override;

    // A row whose record was deleted with SQL leaves the model without the table being read again;
    // possible only while the model holds no changes, submitted or not, and has fetched every row.
    bool canDropDeletedRow(int row) const;
    bool dropDeletedRow(int row);

    bool setHeaderData(const QString& field, Qt::Orientation orientation, const QVariant& value,
                       int role = Qt::EditRole);

    void setType(const QString& field, QVariant::Type type);
    void setType(int column, QVariant::Type type);
    QVariant::Type type(int column) const { return m_types.value(column, QVariant::Invalid); }
    void setDisplayroleType(const QString& field, DISPLAYROLE_TYPE type);
    void setDisplayroleType(int column, DISPLAYROLE_TYPE type);
    DISPLAYROLE_TYPE displayroleType(int column) const { return m_displayTypes.value(column, DRT_DEFAULT); }

    // Company ids used by the rows (as map keys) / replaced through a map old id -> new id.
    void getCompanyIds(QMap<int, int>* ids);
    void updateCompanyIds(QMap<int, int>* ids);
    // Photo rows assigned to a deficiency follow its company; removing a deficiency frees its photos.
    void updateCompany4PhotoModel(int relationId, const QVariant& companyId);
    void removeRelationsFromPhotoModel(int relationId);

    QStringList construction_measure_locations();
    QStringList construction_measure_kks();

    void block_on() { blockSignals(true); }
    void block_off() { blockSignals(false); }

    QVariant data(const QModelIndex& index, int role = Qt::DisplayRole) const override;
    bool setData(const QModelIndex& index, const QVariant& value, int role = Qt::EditRole) override;
    Qt::ItemFlags flags(const QModelIndex& index) const override;

    // The report whose rows the model holds (0 for the models of the diary as a whole).
    void setEntryId(int entryId) { m_entryId = entryId; }
    int entryId() const { return m_entryId; }

    // The editor kind of each column, shared with the delegates of the table views.
    void setEditorNumber(const QString& field, int number);
    void setEditorNumber(int column, int number) { m_editorNumbers.insert(column, number); }
    int editorNumber(int column) const { return m_editorNumbers.value(column, 0); }
    // Editor numbers, header labels and display types of the columns, after the table.
    void initColumns();

    // The delegates live with the widgets; the window installs the factory that builds them.
    // 'column' -1 asks for a delegate of the whole view.
    using DelegateFactory =
        std::function<QObject*(VDRSqlTableModel* model, QObject* view, int column, bool enabled)>;
    static void setDelegateFactory(DelegateFactory factory);
    QObject* createItemDelegate(QObject* view, int column = -1, bool enabled = true);
    // Switches the editors of a delegate built by createItemDelegate off.
    static void disable_editors(QObject* delegate);

    // Drag and drop of rows between views of the same table.
    static QString mimeTypeFor(const QString& sqlTable);
    QStringList mimeTypes() const override;
    QMimeData* mimeData(const QModelIndexList& indexes) const override;
    bool canDropMimeData(const QMimeData* data, Qt::DropAction action, int row, int column,
                         const QModelIndex& parent) const override;
    bool dropMimeData(const QMimeData* data, Qt::DropAction action, int row, int column,
                      const QModelIndex& parent) override;
    Qt::DropActions supportedDropActions() const override;
    Qt::DropActions supportedDragActions() const override;
    // Moves model rows (any order) in front of 'beforeRow' (rowCount() = to the end), renumbering
    // `pos`; rows from 'source' (another type of the same table) change their type. Submits.
    bool moveRowsByPos(VDRSqlTableModel* source, QList<int> rows, int beforeRow);

signals:
    // Forwarded from the delegates to the time recording.
    void hoursChangedByUser(const QModelIndex& index);
    void timeRecordingTimeChangedByUser(const QModelIndex& index, bool valid);
    void calculateHours4TimeRecording();
    // A row the views should show and select (a new or moved row).
    void setItemFocus(const QModelIndex& index);

protected:
    // Sub-table and company rows can be dragged between views.
    bool isDragEnabledTable() const;
    QModelIndex indexInQuery(const QModelIndex& item) const override;

private:
    QStringList distinctTexts(const QString& field);
    void primeNewRecord(int row, QSqlRecord& record);
    bool canRefreshRowsOnly() const;
    int skipDroppedRows(int row) const;

    TABLE_NAMES m_tableName;
    VDRDocument* m_document;
    bool m_generatesIds = false;
    // Bookkeeping of what a submit must read back.
    bool m_refreshRowsOnly = false;
    bool m_needsSelect = false;
    QList<int> m_appendedRows;
    int m_submitsSinceSelect = 0;
    // Rows of the last full select that were dropped since, ascending; the model holds no cached
    // changes while m_cacheClean is true.
    QList<int> m_droppedQueryRows;
    bool m_cacheClean = false;
    int m_entryId = 0;
    QHash<int, int> m_editorNumbers;
    QHash<int, QVariant::Type> m_types;
    QHash<int, DISPLAYROLE_TYPE> m_displayTypes;
};
