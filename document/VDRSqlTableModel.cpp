#include "document/VDRSqlTableModel.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"

#include <QMimeData>

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
    // The views show the new row.
    emit setItemFocus(QSqlTableModel::index(row, 0));
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

// ---- Columns: editor numbers and header labels ----

void VDRSqlTableModel::setEditorNumber(const QString& field, int number)
{
    const int column = fieldIndex(field);
    if (column >= 0)
        setEditorNumber(column, number);
}

namespace {
struct ColumnInfo
{
    const char* field;
    const char* label;
    int editor;
};

// Header labels double as the column names of the suggestion lists.
const ColumnInfo g_commonColumns[] = {
    {"company_id", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Firma"), 2},
    {"comment", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bemerkung"), 0},
    {"description", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Beschreibung"), 0},
    {"date", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Datum"), 0},
};

QList<ColumnInfo> tableColumns(VDRSqlTableModel::TABLE_NAMES table)
{
    using M = VDRSqlTableModel;
    switch (table) {
    case M::TN_ATTENDEE:
        return {{"company_id", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Name / Firma"), 17},
                {"comment", nullptr, 24}};
    case M::TN_WORKFORCE:
        return {{"comment", nullptr, 25},
                {"person_count", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Anz."), 38},
                {"person_type", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Personen"), 38},
                {"man_hours", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Std."), 38}};
    case M::TN_DELAY:
    case M::TN_OBSTRUCTION:
    case M::TN_ACCEPTANCE:
    case M::TN_DEFICIENCY: {
        const int editor = table == M::TN_DELAY         ? 18
                           : table == M::TN_OBSTRUCTION ? 19
                           : table == M::TN_ACCEPTANCE  ? 20
                                                        : 21;
        return {{"roomname", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Raumname"), editor},
                {"roombook_number", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Raumbuch-Nr."), editor},
                {"description", nullptr, table == M::TN_DEFICIENCY ? 54 : editor},
                {"date", nullptr, 35},
                {"image_cnt", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bilder"), 51}};
    }
    case M::TN_DIRECTIVE:
        return {{"description", nullptr, 22}};
    case M::TN_AUXILIARY_SERVICE:
        return {{"description", nullptr, 23}};
    case M::TN_CONSTRUCTION_MEASURE:
        return {{"description", nullptr, 6},
                {"timefrom", QT_TRANSLATE_NOOP("VDRSqlTableModel", "von"), 0},
                {"timeto", QT_TRANSLATE_NOOP("VDRSqlTableModel", "bis"), 0},
                {"location", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Ort"), 33},
                {"kks", QT_TRANSLATE_NOOP("VDRSqlTableModel", "KKS"), 34}};
    case M::TN_CONSTRUCTION_MATERIAL:
        return {{"material", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Baustoff"), 7},
                {"quantity", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Menge"), 39},
                {"unit", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Einheit"), 45},
                {"process", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Vorgang"), 8},
                {"note", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Memo"), 9},
                {"material_temperature", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Temp."), 15},
                {"conditions", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Bedingungen"), 10},
                {"workflow", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Arbeitsablauf"), 11},
                {"document", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Dokument"), 31}};
    case M::TN_SCHEDULED_DELIVERY:
        return {{"deliverynumber", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Plan-Nr."), 26},
                {"deliveryindex", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Index"), 27},
                {"deliverydate", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Datum"), 0},
                {"comment", nullptr, 28},
                {"document", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Dokument"), 31}};
    case M::TN_TELEPHONE_NOTICE:
        return {{"company_id", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Name / Firma"), 17},
                {"description", nullptr, 36},
                {"time", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Uhrzeit"), 0}};
    case M::TN_CONCERN:
        return {{"description", nullptr, 37}};
    case M::TN_TIME_RECORDING:
        return {{"person_count", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Anzahl"), 15},
                {"person_type", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Personen"), 5},
                {"time_from", QT_TRANSLATE_NOOP("VDRSqlTableModel", "von"), 44},
                {"time_to", QT_TRANSLATE_NOOP("VDRSqlTableModel", "bis"), 44},
                {"breaks", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Pause"), 42},
                {"hours", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Stunden"), 43}};
    case M::TN_EQUIPMENT:
        return {{"equipment", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Gerät"), 46},
                {"operating_zone", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Einsatzbereich"), 46},
                {"entry_time", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Beginn"), 47},
                {"exit_time", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Ende"), 48},
                {"operating_time", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Betriebszeit"), 49},
                {"downtime", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Ausfallzeit"), 50},
                {"downtime_reasons", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Ausfallgründe"), 46},
                {"comment", nullptr, 46}};
    case M::TN_PHOTO_PROGRESS:
    case M::TN_PHOTO_DEFICIENCY:
    case M::TN_PHOTO_OBSTRUCTION:
    case M::TN_PHOTO_MEASURE:
    case M::TN_PHOTO_MATERIAL:
        return {{"caption", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Titel"), 0},
                {"comment", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Kommentar"), 30},
                {"relation_id", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Mangel"), 52}};
    case M::TN_COMPANY1:
    case M::TN_COMPANY2:
        return {{"type", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Typ"), 56},
                {"firstname", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Vorname"), 56},
                {"lastname", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Nachname"), 56},
                {"company", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Firma"), 56},
                {"street", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Straße"), 56},
                {"plz", QT_TRANSLATE_NOOP("VDRSqlTableModel", "PLZ"), 56},
                {"city", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Ort"), 56},
                {"telephone", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Telefon"), 56},
                {"telefax", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Telefax"), 56},
                {"mobile", QT_TRANSLATE_NOOP("VDRSqlTableModel", "Mobil"), 56},
                {"email", QT_TRANSLATE_NOOP("VDRSqlTableModel", "E-Mail"), 56}};
    default:
        return {};
    }
}

VDRSqlTableModel::DelegateFactory& delegateFactory()
{
    static VDRSqlTableModel::DelegateFactory factory;
    return factory;
}
} // namespace

void VDRSqlTableModel::initColumns()
{
    if (!sqlTableName(m_tableName).startsWith(QLatin1String("entry_")) && m_tableName != TN_COMPANY1 &&
        m_tableName != TN_COMPANY2)
        return;
    // Value types first: dates, times and booleans have editors of their own.
    for (auto it = m_types.constBegin(); it != m_types.constEnd(); ++it) {
        if (it.value() == QVariant::Date)
            setEditorNumber(it.key(), 13);
        else if (it.value() == QVariant::Time)
            setEditorNumber(it.key(), 14);
        else if (it.value() == QVariant::Bool)
            setEditorNumber(it.key(), 4);
    }
    for (const ColumnInfo& info : g_commonColumns) {
        const int column = fieldIndex(QLatin1String(info.field));
        if (column < 0)
            continue;
        setHeaderData(column, Qt::Horizontal, tr(info.label));
        if (info.editor)
            setEditorNumber(column, info.editor);
        if (QLatin1String(info.field) == QLatin1String("company_id"))
            setDisplayroleType(column, DRT_COMPANY);
    }
    for (const ColumnInfo& info : tableColumns(m_tableName)) {
        const int column = fieldIndex(QLatin1String(info.field));
        if (column < 0)
            continue;
        if (info.label)
            setHeaderData(column, Qt::Horizontal, tr(info.label));
        if (info.editor)
            setEditorNumber(column, info.editor);
    }
}

void VDRSqlTableModel::setDelegateFactory(DelegateFactory factory)
{
    delegateFactory() = std::move(factory);
}

QObject* VDRSqlTableModel::createItemDelegate(QObject* view, int column, bool enabled)
{
    const DelegateFactory& factory = delegateFactory();
    return factory ? factory(this, view, column, enabled) : nullptr;
}

void VDRSqlTableModel::disable_editors(QObject* delegate)
{
    if (delegate)
        QMetaObject::invokeMethod(delegate, "setEditorsEnabled", Q_ARG(bool, false));
}

// ---- Drag and drop ----

QString VDRSqlTableModel::mimeTypeFor(const QString& sqlTable)
{
    return QStringLiteral("application/vnd.varduna2.") + sqlTable;
}

QStringList VDRSqlTableModel::mimeTypes() const
{
    return {mimeTypeFor(sqlTableName(m_tableName))};
}

Qt::DropActions VDRSqlTableModel::supportedDropActions() const
{
    return isDragEnabledTable() ? Qt::MoveAction : Qt::IgnoreAction;
}

Qt::DropActions VDRSqlTableModel::supportedDragActions() const
{
    return supportedDropActions();
}

namespace {
// The payload: the dragged rows as decimal text, then the source type and the source report.
struct DragPayload
{
    QList<int> rows;
    int type = 0;
    int entryId = 0;
    int table = -1;
    bool valid = false;
};

DragPayload readPayload(const QMimeData* data, const QString& mimeType)
{
    DragPayload payload;
    if (!data || !data->hasFormat(mimeType))
        return payload;
    const QByteArray bytes = data->data(mimeType);
    // A handful of row numbers; anything longer did not come from a view of ours.
    if (bytes.size() > 1024 * 1024)
        return payload;
    const QStringList lines = QString::fromLatin1(bytes).split(QLatin1Char('\n'));
    if (lines.size() < 4)
        return payload;
    bool ok = true;
    for (const QString& part : lines.at(0).split(QLatin1Char(' '), Qt::SkipEmptyParts)) {
        const int row = part.toInt(&ok);
        if (!ok || row < 0)
            return payload;
        if (!payload.rows.contains(row))
            payload.rows << row;
    }
    payload.type = lines.at(1).toInt(&ok);
    if (!ok)
        return payload;
    payload.entryId = lines.at(2).toInt(&ok);
    if (!ok)
        return payload;
    payload.table = lines.at(3).toInt(&ok);
    payload.valid = ok && !payload.rows.isEmpty();
    std::sort(payload.rows.begin(), payload.rows.end());
    return payload;
}

VDRSqlTableModel::TABLE_NAMES tableOfType(const QString& sqlTable, int type)
{
    for (int t = 0; t < VDRSqlTableModel::TN_COUNT; ++t) {
        const auto table = VDRSqlTableModel::TABLE_NAMES(t);
        if (VDRSqlTableModel::sqlTableName(table) == sqlTable &&
            VDRSqlTableModel::typeCondition(table) == type)
            return table;
    }
    return VDRSqlTableModel::TN_COUNT;
}
} // namespace

QMimeData* VDRSqlTableModel::mimeData(const QModelIndexList& indexes) const
{
    QList<int> rows;
    for (const QModelIndex& index : indexes) {
        if (index.isValid() && !rows.contains(index.row()))
            rows << index.row();
    }
    if (rows.isEmpty())
        return nullptr;
    std::sort(rows.begin(), rows.end());
    QStringList numbers;
    for (int row : qAsConst(rows))
        numbers << QString::number(row);
    auto* data = new QMimeData;
    data->setData(mimeTypes().constFirst(), numbers.join(QLatin1Char(' ')).toLatin1() + '\n' +
                                                QByteArray::number(typeCondition(m_tableName)) + '\n' +
                                                QByteArray::number(m_entryId) + '\n' +
                                                QByteArray::number(int(m_tableName)));
    return data;
}

bool VDRSqlTableModel::canDropMimeData(const QMimeData* data, Qt::DropAction action, int, int,
                                       const QModelIndex&) const
{
    if (action != Qt::MoveAction || !isDragEnabledTable() || !m_document)
        return false;
    const DragPayload payload = readPayload(data, mimeTypes().constFirst());
    if (!payload.valid || payload.entryId != m_entryId)
        return false;
    // A locked report keeps its rows as they are.
    if (m_entryId > 0 && m_document->modelEntryAll() &&
        m_document->modelEntryAll()->dataById(m_entryId, QStringLiteral("locked"), Qt::EditRole).toInt() == 1)
        return false;
    if (payload.table == m_tableName)
        return true;
    // Report rows may change their type within the table; nothing else changes its model.
    return m_entryId > 0 && tableOfType(sqlTableName(m_tableName), payload.type) != TN_COUNT;
}

bool VDRSqlTableModel::dropMimeData(const QMimeData* data, Qt::DropAction action, int row, int column,
                                    const QModelIndex& parent)
{
    if (!canDropMimeData(data, action, row, column, parent))
        return false;
    const DragPayload payload = readPayload(data, mimeTypes().constFirst());
    VDRSqlTableModel* source = this;
    if (payload.table != m_tableName) {
        source = m_document->modelEntry(m_entryId, tableOfType(sqlTableName(m_tableName), payload.type));
        if (!source)
            return false;
    }
    if (sqlTableName(m_tableName) == QLatin1String("entry_photo") &&
        payload.rows.constLast() - payload.rows.constFirst() + 1 != payload.rows.size()) {
        VDRPrompt::warning(tr("Drag&Drop-Fehler"),
                           tr("Sie können nur einzelne Bilder oder geschlossene Bereiche verschieben!"));
        return false;
    }
    fetch_all();
    int before = row;
    if (before < 0)
        before = parent.isValid() ? parent.row() : rowCount();
    return moveRowsByPos(source, payload.rows, before);
}

bool VDRSqlTableModel::moveRowsByPos(VDRSqlTableModel* source, QList<int> rows, int beforeRow)
{
    const int posColumn = fieldIndex(QStringLiteral("pos"));
    const int idColumn = fieldIndex(QStringLiteral("id"));
    if (!source || posColumn < 0 || idColumn < 0)
        return false;
    fetch_all();
    source->fetch_all();
    const int count = rowCount();
    beforeRow = qBound(0, beforeRow, count);
    std::sort(rows.begin(), rows.end());
    rows.erase(std::unique(rows.begin(), rows.end()), rows.end());
    for (int r : qAsConst(rows)) {
        if (r < 0 || r >= source->rowCount())
            return false;
    }
    const auto idAt = [idColumn](VDRSqlTableModel* model, int r) {
        return model->QSqlTableModel::data(model->QSqlTableModel::index(r, idColumn), Qt::EditRole).toInt();
    };
    const auto posAt = [posColumn](VDRSqlTableModel* model, int r) {
        return model->QSqlTableModel::data(model->QSqlTableModel::index(r, posColumn), Qt::EditRole).toInt();
    };
    QList<int> movedIds;
    for (int r : qAsConst(rows))
        movedIds << idAt(source, r);

    if (source == this) {
        // The new order of the rows; the pos values they had are handed out again in that order,
        // so only the rows between the old and the new place change.
        QList<int> order;
        QList<int> positions;
        for (int r = 0; r < count; ++r) {
            if (r == beforeRow)
                order << rows;
            if (!rows.contains(r))
                order << r;
            positions << posAt(this, r);
        }
        if (beforeRow == count)
            order << rows;
        std::sort(positions.begin(), positions.end());
        bool changed = false;
        for (int i = 0; i < order.size(); ++i) {
            if (posAt(this, order.at(i)) != positions.at(i)) {
                QSqlTableModel::setData(QSqlTableModel::index(order.at(i), posColumn), positions.at(i));
                changed = true;
            }
        }
        if (!changed)
            return true;
    } else {
        // Rows of another type take the type of this model and consecutive pos values at the
        // drop place; the rows behind the place move up by their number.
        const int typeColumn = source->fieldIndex(QStringLiteral("type"));
        if (typeColumn < 0)
            return false;
        const int firstPos = beforeRow < count ? posAt(this, beforeRow) : maxPos() + 1;
        for (int r = beforeRow; r < count; ++r)
            QSqlTableModel::setData(QSqlTableModel::index(r, posColumn), posAt(this, r) + rows.size());
        if (!submitAll())
            return false;
        for (int i = 0; i < rows.size(); ++i) {
            source->QSqlTableModel::setData(source->QSqlTableModel::index(rows.at(i), typeColumn),
                                            typeCondition(m_tableName));
            source->QSqlTableModel::setData(source->QSqlTableModel::index(rows.at(i), posColumn),
                                            firstPos + i);
        }
        if (!source->submitAll())
            return false;
        select();
        fetch_all();
        const int focusRow = rowById(movedIds.constFirst());
        if (focusRow >= 0)
            emit setItemFocus(index(focusRow, std::max(0, fieldIndex(QStringLiteral("pos")))));
        return true;
    }
    if (!submitAll())
        return false;
    if (m_tableName == TN_TIME_RECORDING)
        emit calculateHours4TimeRecording();
    const int focusRow = rowById(movedIds.constFirst());
    if (focusRow >= 0)
        emit setItemFocus(index(focusRow, std::max(0, fieldIndex(QStringLiteral("pos")))));
    return true;
}
