// The document's table models, record ids and meta keys.
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"

#include <QDebug>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>

namespace {
const char* const kDateTimeFormat = "yyyy-MM-ddThh:mm:ss";
}

VDRSqlTableModel* VDRDocument::createModel(VDRSqlTableModel::TABLE_NAMES table, const QString& filter)
{
    VDRSqlTableModel* model = table == VDRSqlTableModel::TN_ENTRY
                                  ? new VDRAllEntryTableModel(this, database())
                                  : new VDRSqlTableModel(table, this, database());
    const QString sqlTable = VDRSqlTableModel::sqlTableName(table);
    model->setTable(sqlTable);
    model->setFilter(filter);

    if (!m_declaredTypes.contains(sqlTable)) {
        QHash<QString, QString> types;
        QSqlQuery q(database());
        if (q.exec(QStringLiteral("PRAGMA table_info(%1)").arg(sqlTable))) {
            while (q.next())
                types.insert(q.value(1).toString(), q.value(2).toString().toUpper());
        }
        m_declaredTypes.insert(sqlTable, types);
    }
    const QHash<QString, QString>& types = m_declaredTypes[sqlTable];
    for (auto it = types.constBegin(); it != types.constEnd(); ++it) {
        if (it.value() == QLatin1String("DATE")) {
            model->setType(it.key(), QVariant::Date);
            model->setDisplayroleType(it.key(), VDRSqlTableModel::DRT_DATE);
        } else if (it.value() == QLatin1String("TIME")) {
            model->setType(it.key(), QVariant::Time);
            model->setDisplayroleType(it.key(), VDRSqlTableModel::DRT_TIME);
        } else if (it.value() == QLatin1String("DATETIME")) {
            model->setType(it.key(), QVariant::DateTime);
        }
    }

    model->initColumns();

    const int posColumn = model->fieldIndex(QStringLiteral("pos"));
    if (posColumn >= 0)
        model->setSort(posColumn, Qt::AscendingOrder);
    if (!model->select())
        qDebug().noquote() << "select failed:" << sqlTable << model->lastError().text();
    model->setGeneratesIds(sqlTable != QLatin1String("meta") && sqlTable != QLatin1String("image") &&
                           sqlTable != QLatin1String("audio") && sqlTable != QLatin1String("id_generator") &&
                           sqlTable != QLatin1String("external_entry_number"));
    return model;
}

void VDRDocument::initModels()
{
    destroyModels();
    m_declaredTypes.clear();
    m_modelMeta = createModel(VDRSqlTableModel::TN_META, QString());
    m_modelVdr = createModel(VDRSqlTableModel::TN_VDR, QString());
    m_modelAddresslist = createModel(VDRSqlTableModel::TN_ADDRESSLIST, QString());
    m_modelCompany1 =
        createModel(VDRSqlTableModel::TN_COMPANY1, QStringLiteral("category = '1' OR category = '-1'"));
    m_modelCompany2 =
        createModel(VDRSqlTableModel::TN_COMPANY2, QStringLiteral("category = '2' OR category = '-2'"));
    m_modelEntryAll = static_cast<VDRAllEntryTableModel*>(createModel(VDRSqlTableModel::TN_ENTRY, QString()));
    // external_entry_number has no TABLE_NAMES value of its own and no generated ids.
    m_modelExternalEntryNumber = new VDRSqlTableModel(VDRSqlTableModel::TN_META, this, database());
    m_modelExternalEntryNumber->setObjectName(QString());
    m_modelExternalEntryNumber->setTable(QStringLiteral("external_entry_number"));
    m_modelExternalEntryNumber->select();
}

void VDRDocument::destroyModels()
{
    for (auto& models : m_entryModels)
        qDeleteAll(models);
    m_entryModels.clear();
    m_entryModelsUsed.clear();
    qDeleteAll(m_addresslistModels);
    m_addresslistModels.clear();
    for (VDRSqlTableModel** model :
         {&m_modelMeta, &m_modelVdr, &m_modelAddresslist, &m_modelCompany1, &m_modelCompany2,
          reinterpret_cast<VDRSqlTableModel**>(&m_modelEntryAll), &m_modelExternalEntryNumber}) {
        delete *model;
        *model = nullptr;
    }
}

void VDRDocument::initEntryModels(int entryId)
{
    if (m_entryModels.contains(entryId)) {
        if (m_entryModelsUsed.isEmpty() || m_entryModelsUsed.constLast() != entryId) {
            m_entryModelsUsed.removeOne(entryId);
            m_entryModelsUsed.append(entryId);
        }
        return;
    }
    QMap<int, VDRSqlTableModel*>& models = m_entryModels[entryId];
    for (VDRSqlTableModel::TABLE_NAMES table : entryTables()) {
        QString filter = QStringLiteral("entry_id = '") + QString::number(entryId) + QLatin1Char('\'');
        const int type = VDRSqlTableModel::typeCondition(table);
        if (type > 0)
            filter += QStringLiteral(" AND type = '") + QString::number(type) + QLatin1Char('\'');
        VDRSqlTableModel* model = createModel(table, filter);
        model->setEntryId(entryId);
        models.insert(table, model);
    }
    m_entryModelsUsed.append(entryId);
    releaseEntryModels();
}

const QVector<VDRSqlTableModel::TABLE_NAMES>& VDRDocument::entryTables()
{
    static const QVector<VDRSqlTableModel::TABLE_NAMES> tables = {
        VDRSqlTableModel::TN_ATTENDEE,
        VDRSqlTableModel::TN_WORKFORCE,
        VDRSqlTableModel::TN_TIME_RECORDING,
        VDRSqlTableModel::TN_DELAY,
        VDRSqlTableModel::TN_OBSTRUCTION,
        VDRSqlTableModel::TN_DEFICIENCY,
        VDRSqlTableModel::TN_ACCEPTANCE,
        VDRSqlTableModel::TN_PHOTO_PROGRESS,
        VDRSqlTableModel::TN_PHOTO_DEFICIENCY,
        VDRSqlTableModel::TN_PHOTO_OBSTRUCTION,
        VDRSqlTableModel::TN_PHOTO_MEASURE,
        VDRSqlTableModel::TN_PHOTO_MATERIAL,
        VDRSqlTableModel::TN_DIRECTIVE,
        VDRSqlTableModel::TN_AUXILIARY_SERVICE,
        VDRSqlTableModel::TN_CONSTRUCTION_MEASURE,
        VDRSqlTableModel::TN_CONSTRUCTION_MATERIAL,
        VDRSqlTableModel::TN_SCHEDULED_DELIVERY,
        VDRSqlTableModel::TN_TELEPHONE_NOTICE,
        VDRSqlTableModel::TN_CONCERN,
        VDRSqlTableModel::TN_EQUIPMENT,
    };
    return tables;
}

bool VDRDocument::entryModelsDirty(int entryId) const
{
    for (const VDRSqlTableModel* model : m_entryModels.value(entryId)) {
        if (model->isDirty())
            return true;
    }
    return false;
}

void VDRDocument::reselectModelsAfterRollback()
{
    // The models' caches still hold what the rolled-back steps wrote.
    for (VDRSqlTableModel* model : {m_modelVdr, m_modelCompany1, m_modelCompany2, m_modelAddresslist}) {
        if (model) {
            model->revertAll();
            model->select();
        }
    }
    if (m_modelEntryAll) {
        m_modelEntryAll->revertAll();
        m_modelEntryAll->select();
    }
    for (const QMap<int, VDRSqlTableModel*>& models : qAsConst(m_entryModels)) {
        for (VDRSqlTableModel* model : models) {
            model->revertAll();
            model->select();
        }
    }
}

void VDRDocument::releaseEntryModels()
{
    // Oldest first; the report used last always stays.
    for (int i = 0; m_entryModels.size() > keptEntryModelSets() && i < m_entryModelsUsed.size() - 1;) {
        const int entryId = m_entryModelsUsed.at(i);
        if (m_entryModelPins.value(entryId) > 0 || entryModelsDirty(entryId)) {
            ++i;
            continue;
        }
        m_entryModelsUsed.removeAt(i);
        qDeleteAll(m_entryModels.take(entryId));
    }
}

void VDRDocument::pinEntryModels(int entryId)
{
    ++m_entryModelPins[entryId];
}

void VDRDocument::unpinEntryModels(int entryId)
{
    auto it = m_entryModelPins.find(entryId);
    if (it == m_entryModelPins.end())
        return;
    if (--it.value() <= 0) {
        m_entryModelPins.erase(it);
        releaseEntryModels();
    }
}

VDRDocument::EntryModelsPin::EntryModelsPin(VDRDocument* document, int entryId)
    : m_document(document), m_entryId(entryId)
{
    if (m_document)
        m_document->pinEntryModels(entryId);
}

VDRDocument::EntryModelsPin::~EntryModelsPin()
{
    if (m_document)
        m_document->unpinEntryModels(m_entryId);
}

VDRSqlTableModel* VDRDocument::modelEntry(int entryId, VDRSqlTableModel::TABLE_NAMES table)
{
    if (!m_valid && !database().isOpen())
        return nullptr;
    initEntryModels(entryId);
    return m_entryModels.value(entryId).value(table, nullptr);
}

QList<VDRSqlTableModel*> VDRDocument::entryModels(int entryId)
{
    initEntryModels(entryId);
    return m_entryModels.value(entryId).values();
}

void VDRDocument::initAddresslistModels(int listId)
{
    if (m_addresslistModels.contains(listId))
        return;
    m_addresslistModels.insert(listId, createModel(VDRSqlTableModel::TN_ADDRESSLIST_ITEM,
                                                   QStringLiteral("addresslist_id = '") +
                                                       QString::number(listId) + QLatin1Char('\'')));
}

VDRSqlTableModel* VDRDocument::modelAddresslistItem(int listId)
{
    initAddresslistModels(listId);
    return m_addresslistModels.value(listId, nullptr);
}

void VDRDocument::sqlTableIdGenerator(int row, QSqlRecord& record)
{
    if (auto* model = qobject_cast<VDRSqlTableModel*>(sender()))
        sqlTableIdGenerator(model, row, record);
}

void VDRDocument::sqlTableIdGenerator(VDRSqlTableModel* model, int row, QSqlRecord& record)
{
    Q_UNUSED(row)
    if (!model)
        return;
    const QVariant current = record.value(QStringLiteral("id"));
    if (!current.isNull() && current.toInt() != 0)
        return;
    const QString table = VDRSqlTableModel::sqlTableName(model->tableNameId());

    beginTransaction();
    int newId = 1;
    QSqlQuery q(database());
    q.prepare(QStringLiteral("SELECT id_table, id_counter FROM id_generator WHERE id_table = :tablename"));
    q.bindValue(QStringLiteral(":tablename"), table);
    if (q.exec() && q.next()) {
        newId = q.value(1).toInt() + 1;
        q.finish();
        QSqlQuery update(database());
        update.prepare(
            QStringLiteral("UPDATE id_generator SET id_counter = :newid WHERE id_table = :tablename"));
        update.bindValue(QStringLiteral(":newid"), newId);
        update.bindValue(QStringLiteral(":tablename"), table);
        if (!update.exec())
            qDebug().noquote() << "id generator:" << update.lastError().text();
    } else {
        q.finish();
        QSqlQuery insert(database());
        insert.prepare(
            QStringLiteral("INSERT INTO id_generator (id_table, id_counter) VALUES (:tablename, 1)"));
        insert.bindValue(QStringLiteral(":tablename"), table);
        if (!insert.exec())
            qDebug().noquote() << "id generator:" << insert.lastError().text();
    }
    endTransaction();

    record.setGenerated(QStringLiteral("id"), true);
    record.setValue(QStringLiteral("id"), newId);
}

QString VDRDocument::metaValue(const QString& key) const
{
    if (!m_modelMeta)
        return QString();
    m_modelMeta->fetch_all();
    const int row = m_modelMeta->record_position(QStringLiteral("key"), key);
    return row < 0 ? QString() : m_modelMeta->data(row, QStringLiteral("value"), Qt::EditRole).toString();
}

bool VDRDocument::hasMetaKey(const QString& key) const
{
    return m_modelMeta && m_modelMeta->record_position(QStringLiteral("key"), key) >= 0;
}

bool VDRDocument::setMetaValue(const QString& key, const QString& value)
{
    if (!m_modelMeta)
        return false;
    const int row = m_modelMeta->record_position(QStringLiteral("key"), key);
    if (row >= 0)
        m_modelMeta->setData(row, QStringLiteral("value"), value);
    else
        m_modelMeta->appendRow({{QStringLiteral("key"), key}, {QStringLiteral("value"), value}});
    return m_modelMeta->submitAll();
}

int VDRDocument::metaFlag(const QString& key) const
{
    return hasMetaKey(key) ? metaValue(key).toInt() : 0;
}

bool VDRDocument::setMetaFlag(const QString& key)
{
    return setMetaValue(key, QStringLiteral("1"));
}

QDateTime VDRDocument::masterDataImportVersion() const
{
    const QString text = metaValue(QStringLiteral("masterDataImportVersion"));
    return text.isEmpty() ? QDateTime() : QDateTime::fromString(text, QLatin1String(kDateTimeFormat));
}

bool VDRDocument::setMasterDataImportVersion(const QDateTime& version)
{
    if (!version.isValid())
        return false;
    return setMetaValue(QStringLiteral("masterDataImportVersion"),
                        version.toString(QLatin1String(kDateTimeFormat)));
}

QString VDRDocument::projectName() const
{
    if (!m_modelVdr || m_modelVdr->rowCount() == 0)
        return QString();
    return m_modelVdr->data(0, QStringLiteral("name"), Qt::EditRole).toString();
}
