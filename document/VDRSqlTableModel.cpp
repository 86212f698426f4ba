#include "document/VDRSqlTableModel.h"

#include "document/VDRDocument.h"

#include <QDate>
#include <QDebug>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTime>

#include <algorithm>

namespace {
struct TableInfo
{
    const char* displayName;
    const char* sqlTable;
    int type;
};

// Indexed by TABLE_NAMES.
const TableInfo g_tables[VDRSqlTableModel::TN_COUNT] = {
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bau-Besetzung"), "entry_workforce", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Verzüge"), "entry_progress", 1},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Behinderungen"), "entry_progress", 2},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Mängel"), "entry_progress", 4},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Abnahmen"), "entry_progress", 3},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bilder Leistungsstand"), "entry_photo", 1},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bilder Mängel"), "entry_photo", 2},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bilder Behinderungen"), "entry_photo", 3},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Weisungen"), "entry_task", 1},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Zusatzleistungen"), "entry_task", 2},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Baumaßnahmen"), "entry_constructionmeasure", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Baustoffe"), "entry_constructionmaterial", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Übergaben"), "entry_scheduleddelivery", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Meta"), "meta", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "VDR"), "vdr", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Addressliste"), "addresslist", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Firma1"), "company", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Firma2"), "company", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "AddresslistEintrag"), "addresslist_item", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Person"), "entry_attendee", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Telefon-Notizen"), "entry_telephone_notice", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bedenkenanmeldungen"), "entry_concern", 0},
    {"", "entry", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Zeiterfassung"), "entry_time_recording", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Geräte und Maschinen"), "entry_equipment", 0},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bilder Baumaßnahmen"), "entry_photo", 4},
    {QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bilder Baustoffe"), "entry_photo", 5},
};
} // namespace

VDRSqlTableModel::VDRSqlTableModel(TABLE_NAMES tableName, VDRDocument* document, QSqlDatabase db)
    : QSqlTableModel(document, db), m_tableName(tableName), m_document(document)
{
    setObjectName(displayName(tableName));
    setEditStrategy(QSqlTableModel::OnManualSubmit);
    // Connected to itself, not to the document: the document would have to find the model among
    // the senders of every model of the diary.
    connect(this, &QSqlTableModel::primeInsert, this, &VDRSqlTableModel::primeNewRecord);
}

void VDRSqlTableModel::primeNewRecord(int row, QSqlRecord& record)
{
    if (m_generatesIds && m_document)
        m_document->sqlTableIdGenerator(this, row, record);
}

QString VDRSqlTableModel::displayName(TABLE_NAMES tableName)
{
    if (tableName < 0 || tableName >= TN_COUNT)
        return QString();
    const char* name = g_tables[tableName].displayName;
    return *name ? tr(name) : QString();
}

QString VDRSqlTableModel::sqlTableName(TABLE_NAMES tableName)
{
    if (tableName < 0 || tableName >= TN_COUNT)
        return QString();
    return QString::fromLatin1(g_tables[tableName].sqlTable);
}

int VDRSqlTableModel::typeCondition(TABLE_NAMES tableName)
{
    if (tableName < 0 || tableName >= TN_COUNT)
        return 0;
    return g_tables[tableName].type;
}

void VDRSqlTableModel::fetch_all()
{
    while (canFetchMore())
        fetchMore();
}

bool VDRSqlTableModel::appendRow(const QHash<QString, QVariant>& values)
{
    fetch_all();
    return insertRow(rowCount(), values);
}

bool VDRSqlTableModel::insertRow(int row, const QHash<QString, QVariant>& values)
{
    fetch_all();
    if (!insertRows(row, 1))
        return false;
    for (auto it = values.constBegin(); it != values.constEnd(); ++it) {
        if (!setData(row, it.key(), it.value()))
            qWarning().noquote() << "setData failed:" << sqlTableName(m_tableName) << it.key();
    }
    return true;
}

bool VDRSqlTableModel::setData(int row, const QString& field, const QVariant& value, int role)
{
    const int column = fieldIndex(field);
    if (column < 0)
        return false;
    return setData(QSqlTableModel::index(row, column), value, role);
}

QVariant VDRSqlTableModel::data(int row, const QString& field, int role) const
{
    const int column = fieldIndex(field);
    if (column < 0)
        return QVariant();
    return data(QSqlTableModel::index(row, column), role);
}

QModelIndex VDRSqlTableModel::index(int row, const QString& field) const
{
    const int column = fieldIndex(field);
    if (column < 0)
        return QModelIndex();
    return QSqlTableModel::index(row, column);
}

int VDRSqlTableModel::rowById(int id)
{
    fetch_all();
    const int column = fieldIndex(QStringLiteral("id"));
    if (column < 0)
        return -1;
    const int rows = rowCount();
    for (int row = 0; row < rows; ++row) {
        if (QSqlTableModel::data(QSqlTableModel::index(row, column), Qt::EditRole).toInt() == id)
            return row;
    }
    return -1;
}

QModelIndex VDRSqlTableModel::indexById(int id, const QString& field)
{
    const int row = rowById(id);
    return row < 0 ? QModelIndex() : index(row, field);
}

bool VDRSqlTableModel::setDataById(int id, const QString& field, const QVariant& value, int role)
{
    const int row = rowById(id);
    return row >= 0 && setData(row, field, value, role);
}

QVariant VDRSqlTableModel::dataById(int id, const QString& field, int role)
{
    const int row = rowById(id);
    return row < 0 ? QVariant() : data(row, field, role);
}

int VDRSqlTableModel::last_id()
{
    fetch_all();
    const int column = fieldIndex(QStringLiteral("id"));
    int result = 0;
    if (column < 0)
        return result;
    for (int row = 0; row < rowCount(); ++row)
        result =
            std::max(result, QSqlTableModel::data(QSqlTableModel::index(row, column), Qt::EditRole).toInt());
    return result;
}

int VDRSqlTableModel::maxPos()
{
    fetch_all();
    const int column = fieldIndex(QStringLiteral("pos"));
    int result = 0;
    if (column < 0)
        return result;
    for (int row = 0; row < rowCount(); ++row)
        result =
            std::max(result, QSqlTableModel::data(QSqlTableModel::index(row, column), Qt::EditRole).toInt());
    return result;
}

int VDRSqlTableModel::record_position(const QString& field, const QVariant& value)
{
    fetch_all();
    const int column = fieldIndex(field);
    if (column < 0)
        return -1;
    for (int row = 0; row < rowCount(); ++row) {
        if (QSqlTableModel::data(QSqlTableModel::index(row, column), Qt::EditRole) == value)
            return row;
    }
    return -1;
}

bool VDRSqlTableModel::submitAll()
{
    m_refreshRowsOnly = canRefreshRowsOnly();
    const bool ok = QSqlTableModel::submitAll();
    m_refreshRowsOnly = false;
    if (ok)
        return true;
    qDebug("SQL-Error: %s\n", qPrintable(lastError().text()));
    return false;
}

bool VDRSqlTableModel::canRefreshRowsOnly() const
{
    // Without application-assigned ids a new row's key is known only to SQLite; with a filter or a
    // sort order a changed row may have to leave or move; rows not yet fetched would land behind
    // the appended ones. Submitted rows stay in the model's cache of changes until the next full
    // select, so one now and then keeps that cache small.
    const int submitsBetweenSelects = 64;
    return m_generatesIds && !m_needsSelect && filter().isEmpty() && orderByClause().isEmpty() &&
           !canFetchMore() && m_submitsSinceSelect < submitsBetweenSelects;
}

bool VDRSqlTableModel::select()
{
    // QSqlTableModel::submitAll() ends with a select in manual-submit mode.
    if (m_refreshRowsOnly) {
        ++m_submitsSinceSelect;
        bool ok = true;
        for (const int row : qAsConst(m_appendedRows))
            ok &= selectRow(row);
        m_appendedRows.clear();
        return ok;
    }
    m_appendedRows.clear();
    m_needsSelect = false;
    m_submitsSinceSelect = 0;
    m_droppedQueryRows.clear();
    m_cacheClean = QSqlTableModel::select();
    return m_cacheClean;
}

void VDRSqlTableModel::clear()
{
    m_droppedQueryRows.clear();
    m_cacheClean = false;
    QSqlTableModel::clear();
}

int VDRSqlTableModel::rowCount(const QModelIndex& parent) const
{
    const int rows = QSqlTableModel::rowCount(parent);
    return parent.isValid() ? rows : rows - m_droppedQueryRows.size();
}

QModelIndex VDRSqlTableModel::indexInQuery(const QModelIndex& item) const
{
    const QModelIndex inQuery = QSqlTableModel::indexInQuery(item);
    if (!inQuery.isValid() || m_droppedQueryRows.isEmpty())
        return inQuery;
    return createIndex(skipDroppedRows(inQuery.row()), inQuery.column(), inQuery.internalPointer());
}

int VDRSqlTableModel::skipDroppedRows(int row) const
{
    for (const int dropped : m_droppedQueryRows) {
        if (dropped > row)
            break;
        ++row;
    }
    return row;
}

bool VDRSqlTableModel::canDropDeletedRow(int row) const
{
    // Cached changes are keyed by row and would not move with the rows behind a dropped one.
    // Dropped rows cost a little on every read, so a full select now and then clears them.
    const int droppedBetweenSelects = 64;
    return m_cacheClean && !canFetchMore() && row >= 0 && row < rowCount() &&
           m_droppedQueryRows.size() < droppedBetweenSelects;
}

bool VDRSqlTableModel::dropDeletedRow(int row)
{
    if (!canDropDeletedRow(row))
        return select();
    // Without cached changes a model row is the query row after skipping the dropped ones.
    const int queryRow = skipDroppedRows(row);
    beginRemoveRows(QModelIndex(), row, row);
    m_droppedQueryRows.insert(
        std::upper_bound(m_droppedQueryRows.begin(), m_droppedQueryRows.end(), queryRow) -
            m_droppedQueryRows.begin(),
        queryRow);
    endRemoveRows();
    return true;
}

void VDRSqlTableModel::revertRow(int row)
{
    // Reverting an appended row removes it and moves the rows behind it (revertAll comes here too).
    if (!m_appendedRows.isEmpty())
        m_needsSelect = true;
    QSqlTableModel::revertRow(row);
}

bool VDRSqlTableModel::insertRows(int row, int count, const QModelIndex& parent)
{
    const bool appended = row == rowCount();
    m_cacheClean = false;
    if (!QSqlTableModel::insertRows(row, count, parent))
        return false;
    if (!appended)
        m_needsSelect = true;
    for (int r = row; r < row + count; ++r)
        m_appendedRows.append(r);
    return true;
}

bool VDRSqlTableModel::removeRows(int row, int count, const QModelIndex& parent)
{
    // A removed row stays as a blank row until the next full select.
    m_needsSelect = true;
    m_cacheClean = false;
    return QSqlTableModel::removeRows(row, count, parent);
}

bool VDRSqlTableModel::setHeaderData(const QString& field, Qt::Orientation orientation, const QVariant& value,
                                     int role)
{
    const int column = fieldIndex(field);
    return column >= 0 && QSqlTableModel::setHeaderData(column, orientation, value, role);
}

void VDRSqlTableModel::setType(const QString& field, QVariant::Type type)
{
    setType(fieldIndex(field), type);
}

void VDRSqlTableModel::setType(int column, QVariant::Type type)
{
    if (column >= 0)
        m_types.insert(column, type);
}

void VDRSqlTableModel::setDisplayroleType(const QString& field, DISPLAYROLE_TYPE type)
{
    setDisplayroleType(fieldIndex(field), type);
}

void VDRSqlTableModel::setDisplayroleType(int column, DISPLAYROLE_TYPE type)
{
    if (column >= 0)
        m_displayTypes.insert(column, type);
}

void VDRSqlTableModel::getCompanyIds(QMap<int, int>* ids)
{
    if (!ids)
        return;
    fetch_all();
    const int column = fieldIndex(QStringLiteral("company_id"));
    if (column < 0)
        return;
    for (int row = 0; row < rowCount(); ++row) {
        const QVariant v = QSqlTableModel::data(QSqlTableModel::index(row, column), Qt::EditRole);
        if (!v.isNull() && v.toInt() > 0)
            ids->insert(v.toInt(), v.toInt());
    }
}

void VDRSqlTableModel::updateCompanyIds(QMap<int, int>* ids)
{
    if (!ids || ids->isEmpty())
        return;
    fetch_all();
    const int column = fieldIndex(QStringLiteral("company_id"));
    if (column < 0)
        return;
    for (int row = 0; row < rowCount(); ++row) {
        const QModelIndex idx = QSqlTableModel::index(row, column);
        const QVariant v = QSqlTableModel::data(idx, Qt::EditRole);
        if (!v.isNull() && ids->contains(v.toInt()))
            QSqlTableModel::setData(idx, ids->value(v.toInt()));
    }
}

void VDRSqlTableModel::updateCompany4PhotoModel(int relationId, const QVariant& companyId)
{
    fetch_all();
    const int relColumn = fieldIndex(QStringLiteral("relation_id"));
    const int companyColumn = fieldIndex(QStringLiteral("company_id"));
    if (relColumn < 0 || companyColumn < 0)
        return;
    for (int row = 0; row < rowCount(); ++row) {
        if (QSqlTableModel::data(QSqlTableModel::index(row, relColumn), Qt::EditRole).toInt() == relationId)
            QSqlTableModel::setData(QSqlTableModel::index(row, companyColumn), companyId);
    }
}

void VDRSqlTableModel::removeRelationsFromPhotoModel(int relationId)
{
    fetch_all();
    const int relColumn = fieldIndex(QStringLiteral("relation_id"));
    if (relColumn < 0)
        return;
    for (int row = 0; row < rowCount(); ++row) {
        const QModelIndex idx = QSqlTableModel::index(row, relColumn);
        if (QSqlTableModel::data(idx, Qt::EditRole).toInt() == relationId)
            QSqlTableModel::setData(idx, -1);
    }
}

QStringList VDRSqlTableModel::distinctTexts(const QString& field)
{
    QStringList result;
    if (sqlTableName(m_tableName) != QLatin1String("entry_constructionmeasure"))
        return result;
    QSqlQuery q(database());
    if (!q.exec(QStringLiteral(
                    "SELECT DISTINCT %1 FROM entry_constructionmeasure WHERE %1 IS NOT NULL ORDER BY %1")
                    .arg(field)))
        return result;
    while (q.next()) {
        const QString text = q.value(0).toString();
        if (!text.trimmed().isEmpty())
            result << text;
    }
    return result;
}

QStringList VDRSqlTableModel::construction_measure_locations()
{
    return distinctTexts(QStringLiteral("location"));
}

QStringList VDRSqlTableModel::construction_measure_kks()
{
    return distinctTexts(QStringLiteral("kks"));
}

QVariant VDRSqlTableModel::data(const QModelIndex& idx, int role) const
{
    const DISPLAYROLE_TYPE type = displayroleType(idx.column());
    if (type == DRT_CHECKBOX) {
        if (role == Qt::CheckStateRole)
            return QSqlTableModel::data(idx, Qt::EditRole).toInt() ? Qt::Checked : Qt::Unchecked;
        if (role == Qt::DisplayRole)
            return QVariant();
    }
    if (role == Qt::DisplayRole) {
        const QVariant v = QSqlTableModel::data(idx, Qt::EditRole);
        switch (type) {
        case DRT_DATE:
            return v.isNull() ? QVariant() : QVariant(v.toDate().toString(QStringLiteral("dd.MM.yyyy")));
        case DRT_TIME:
            return v.isNull() ? QVariant() : QVariant(v.toTime().toString(QStringLiteral("hh:mm")));
        case DRT_HOURS:
            return v.isNull() ? QVariant() : QVariant(QString::number(v.toDouble(), 'f', 2));
        default:
            break;
        }
    }
    return QSqlTableModel::data(idx, role);
}

bool VDRSqlTableModel::setData(const QModelIndex& idx, const QVariant& value, int role)
{
    m_cacheClean = false;
    if (role == Qt::CheckStateRole && displayroleType(idx.column()) == DRT_CHECKBOX)
        return QSqlTableModel::setData(idx, value.toInt() == Qt::Checked ? 1 : 0, Qt::EditRole);
    const QVariant::Type type = m_types.value(idx.column(), QVariant::Invalid);
    if (role == Qt::EditRole && type != QVariant::Invalid && !value.isNull() && value.type() != type) {
        QVariant converted = value;
        if (converted.convert(type))
            return QSqlTableModel::setData(idx, converted, role);
    }
    return QSqlTableModel::setData(idx, value, role);
}

bool VDRSqlTableModel::isDragEnabledTable() const
{
    const QString table = sqlTableName(m_tableName);
    return table.startsWith(QLatin1String("entry_")) || table == QLatin1String("company");
}

Qt::ItemFlags VDRSqlTableModel::flags(const QModelIndex& idx) const
{
    Qt::ItemFlags f = QSqlTableModel::flags(idx);
    if (displayroleType(idx.column()) == DRT_CHECKBOX)
        f |= Qt::ItemIsUserCheckable;
    if (isDragEnabledTable())
        f |= Qt::ItemIsDragEnabled | Qt::ItemIsDropEnabled;
    return f;
}
