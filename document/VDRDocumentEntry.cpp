// Report numbers and report creation.
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"

#include <QDate>
#include <QSettings>
#include <QTime>

namespace {
const QString kDraftSuffix = QStringLiteral(" (Entwurf)");

QString padded(const QString& digits, int width)
{
    return digits.rightJustified(width, QLatin1Char('0'));
}
} // namespace

int VDRDocument::entryNumberDigits(const QString& number)
{
    int digits = 0;
    while (digits < number.size() && number.at(digits).isDigit())
        ++digits;
    return digits == 0 ? -1 : digits;
}

int VDRDocument::entryNumberDigits(int row) const
{
    return entryNumberDigits(m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString());
}

QString VDRDocument::cutNumber(const QString& number)
{
    int end = 0;
    while (end < number.size() && number.at(end).isDigit())
        ++end;
    if (end < number.size() && number.at(end) != QLatin1Char(' ') && number.at(end) != QLatin1Char('('))
        ++end; // the letter of an inserted report
    return number.left(end);
}

QString VDRDocument::numberWithUserId(const QString& number, const QString& userId)
{
    if (userId.isEmpty())
        return number;
    const int bracket = number.indexOf(QLatin1Char('('));
    if (bracket < 0)
        return number + QLatin1Char('-') + userId;
    // "012 (Entwurf)" -> "012-AB (Entwurf)": the id goes before the blank that precedes "(".
    int insertAt = bracket;
    if (insertAt > 0 && number.at(insertAt - 1) == QLatin1Char(' '))
        --insertAt;
    return number.left(insertAt) + QLatin1Char('-') + userId + number.mid(insertAt);
}

QString VDRDocument::entryNumberString(int row) const
{
    return cutNumber(m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString());
}

QChar VDRDocument::entryNumberLetter(int row) const
{
    const QString number = m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString();
    const int digits = entryNumberDigits(number);
    if (digits < 0 || digits >= number.size())
        return QChar(0);
    const QChar c = number.at(digits);
    return (c == QLatin1Char(' ') || c == QLatin1Char('(')) ? QChar(0) : c;
}

int VDRDocument::entryNumberInt(int row) const
{
    const QString number = m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString();
    const int digits = entryNumberDigits(number);
    return digits < 0 ? 0 : number.left(digits).toInt();
}

QString VDRDocument::entryNumberWithUserId(int row) const
{
    return numberWithUserId(m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString(),
                            m_modelEntryAll->data(row, QStringLiteral("user_id"), Qt::EditRole).toString());
}

QString VDRDocument::externalEntryNumberString(int row) const
{
    return cutNumber(m_modelExternalEntryNumber->data(row, QStringLiteral("number"), Qt::EditRole).toString());
}

int VDRDocument::maxEntryNumber() const
{
    m_modelEntryAll->fetch_all();
    int result = 0;
    for (int row = 0; row < m_modelEntryAll->rowCount(); ++row)
        result = std::max(result, entryNumberInt(row));
    return result;
}

int VDRDocument::maxEntryNumber(int& number, QChar& letter) const
{
    m_modelEntryAll->fetch_all();
    int bestRow = -1;
    number = 0;
    letter = QChar(0);
    for (int row = 0; row < m_modelEntryAll->rowCount(); ++row) {
        const int n = entryNumberInt(row);
        const QChar l = entryNumberLetter(row);
        if (bestRow < 0 || n > number || (n == number && l > letter)) {
            bestRow = row;
            number = n;
            letter = l;
        }
    }
    return bestRow;
}

int VDRDocument::maxEntryID() const
{
    return m_modelEntryAll->last_id();
}

void VDRDocument::entrySetNumberText(int row)
{
    const QString number = m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString();
    const bool locked = m_modelEntryAll->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0;
    if (locked) {
        const QString cut = cutNumber(number);
        if (cut != number)
            m_modelEntryAll->setData(row, QStringLiteral("number"), cut);
    } else if (!number.endsWith(kDraftSuffix)) {
        m_modelEntryAll->setData(row, QStringLiteral("number"), cutNumber(number) + kDraftSuffix);
    }
}

void VDRDocument::entryNumbersAddDigit(int digits)
{
    if (digits != 4 && digits != 5)
        return;
    m_modelEntryAll->fetch_all();
    if (m_modelEntryAll->rowCount() == 0 || entryNumberDigits(0) >= digits)
        return;
    VDRPrompt::instance()->beginNotice(
        tr("Umstellung der Datenbank"),
        tr("Der Baubericht Nr. %1 wird angelegt. Die Datenbank wird jetzt auf %2-stellige Berichtsnummern "
           "umgestellt.\nDieser Vorgang kann einige Minuten dauern.")
            .arg(digits == 4 ? QStringLiteral("1000") : QStringLiteral("10000"))
            .arg(digits));
    for (int row = 0; row < m_modelEntryAll->rowCount(); ++row) {
        const QString number = m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString();
        m_modelEntryAll->setData(row, QStringLiteral("number"), QLatin1Char('0') + number);
    }
    m_modelEntryAll->submitAll();
    VDRPrompt::instance()->endNotice();
}

int VDRDocument::appendEntry()
{
    const int n = maxEntryNumber();
    if (n >= 99999) {
        VDRPrompt::warning(tr("Bauberichtnummer ungültig "),
                           tr("Sie können keinen Baubericht mit einer Bauberichtnummer größer 99999 anlegen.\n"
                              "Reduzieren Sie die höchste Bauberichtnummer oder legen Sie eine neue Datei an."));
        return -1;
    }
    if (n == 9999)
        entryNumbersAddDigit(5);
    else if (n == 999)
        entryNumbersAddDigit(4);

    m_modelEntryAll->fetch_all();
    const int digits = m_modelEntryAll->rowCount() > 0 ? std::max(3, entryNumberDigits(0)) : 3;
    const QString number = padded(QString::number(n + 1), digits);

    m_modelExternalEntryNumber->fetch_all();
    for (int row = 0; row < m_modelExternalEntryNumber->rowCount(); ++row) {
        QString external = externalEntryNumberString(row);
        external = external.left(std::max(0, entryNumberDigits(external)));
        if (external.isEmpty())
            continue;
        const int width = std::max(external.size(), number.size());
        if (padded(external, width) == padded(number, width)) {
            const QString file =
                m_modelExternalEntryNumber->data(row, QStringLiteral("filepath"), Qt::EditRole).toString();
            const VDRPrompt::StandardButton answer = VDRPrompt::instance()->question(
                VDRPrompt::Warning, tr("Warnung"),
                tr("Die Nummer %1 ist bereits in der Vorgänger-Datei %2 vergeben!\nNummer trotzdem vergeben?")
                    .arg(number, file),
                VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::Yes, VDRPrompt::No);
            if (answer != VDRPrompt::Yes)
                return -1;
            break;
        }
    }

    if (m_modelVdr->rowCount() > 0) {
        const int counter = m_modelVdr->dataById(1, QStringLiteral("entrycounter"), Qt::EditRole).toInt();
        m_modelVdr->setDataById(1, QStringLiteral("entrycounter"), counter + 1);
        m_modelVdr->submitAll();
    }

    const QTime now = QTime::currentTime();
    const QString empty = QStringLiteral("");
    const bool ok = m_modelEntryAll->appendRow({
        {"locked", 0},
        {"persistent_document", QVariant(QVariant::ByteArray)},
        {"persistent_document_ct", QVariant(QVariant::String)},
        {"number", number + kDraftSuffix},
        {"inspection_date", QDate::currentDate()},
        {"inspection_time_from", now},
        {"inspection_time_to", now},
        {"env_time", now},
        {"env_weather1", empty},
        {"env_weather2", empty},
        {"env_weather3", empty},
        {"env_temperature", empty},
        {"env_humidity", empty},
        {"progress", empty},
        {"deficiencies", empty},
        {"tests", empty},
        {"interventions", empty},
        {"special_incidents", empty},
        {"notice", empty},
        {"construction_material_sample", 0},
        {"print_notice", 1},
        {"print_telephone_notice", 1},
        {"progress_audio_id", 0},
        {"user_id", QSettings().value(QStringLiteral("entry/UID"), QStringLiteral("")).toString() + QStringLiteral("")},
        {"creation_date", QVariant(QVariant::DateTime)},
        {"exported_by_app", 0},
        {"import_version", QVariant(QVariant::DateTime)},
    });
    return ok ? 1 : 0;
}

bool VDRDocument::appendCompany1(const QString& type)
{
    const QString empty = QStringLiteral("");
    return m_modelCompany1->appendRow({{"category", 1},
                                       {"type", type},
                                       {"firstname", empty},
                                       {"lastname", empty},
                                       {"company", empty},
                                       {"street", empty},
                                       {"plz", empty},
                                       {"city", empty},
                                       {"telephone", empty},
                                       {"telefax", empty},
                                       {"mobile", empty},
                                       {"email", empty},
                                       {"pos", m_modelCompany1->maxPos() + 1}});
}

bool VDRDocument::appendCompany2()
{
    const QString empty = QStringLiteral("");
    return m_modelCompany2->appendRow({{"category", 2},
                                       {"type", empty},
                                       {"firstname", empty},
                                       {"lastname", empty},
                                       {"company", empty},
                                       {"street", empty},
                                       {"plz", empty},
                                       {"city", empty},
                                       {"telephone", empty},
                                       {"telefax", empty},
                                       {"mobile", empty},
                                       {"email", empty},
                                       {"pos", m_modelCompany2->maxPos() + 1}});
}

// Placeholders until the report operations land.
bool VDRDocument::appendEntryAttendee(int) { return false; }
bool VDRDocument::appendEntryWorkforce(int) { return false; }
bool VDRDocument::appendEntryTimeRecording(int, int) { return false; }
bool VDRDocument::appendEntryDelay(int) { return false; }
bool VDRDocument::appendEntryObstruction(int) { return false; }
bool VDRDocument::appendEntryDfcy(int) { return false; }
bool VDRDocument::appendEntryAcceptance(int) { return false; }
bool VDRDocument::appendEntryPhoto1(int, const QDate&, const QString&, int) { return false; }
bool VDRDocument::appendEntryPhoto2(int, const QDate&, const QString&, int) { return false; }
bool VDRDocument::appendEntryPhoto3(int, const QDate&, const QString&, int) { return false; }
bool VDRDocument::appendEntryPhoto4(int, const QDate&, const QString&, int) { return false; }
bool VDRDocument::appendEntryPhoto5(int, const QDate&, const QString&, int) { return false; }
bool VDRDocument::appendEntryDirective(int) { return false; }
bool VDRDocument::appendEntryAuxiliaryservice(int) { return false; }
bool VDRDocument::appendEntryConstructionmeasure(int) { return false; }
bool VDRDocument::appendEntryConstructionmaterial(int) { return false; }
bool VDRDocument::appendEntryScheduleddelivery(int) { return false; }
bool VDRDocument::appendEntryTelephoneNotice(int) { return false; }
bool VDRDocument::appendEntryConcern(int) { return false; }
bool VDRDocument::appendEntryEquipment(int) { return false; }
bool VDRDocument::copyEntryAll(int) { return false; }
bool VDRDocument::removeEntryAll(int) { return false; }
bool VDRDocument::lockEntry(int, bool) { return false; }
bool VDRDocument::deleteAudioRecord(int) { return false; }
void VDRDocument::lockCompanyRecords4lockedEntry(int) {}
