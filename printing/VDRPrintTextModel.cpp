#include "printing/VDRPrintTextModel.h"

#include "document/VDRPrompt.h"

#include <QLocale>
#include <QRegularExpression>
#include <QSettings>

namespace {
const int kVersion = 1;

QStringList placeholders(const QString& text)
{
    static const QRegularExpression re(QStringLiteral("(%[0-9]+)"));
    QStringList found;
    auto it = re.globalMatch(text);
    while (it.hasNext())
        found << it.next().captured(1);
    found.sort();
    return found;
}
} // namespace

VDRPrintTextModel::VDRPrintTextModel(const QStringList& defaults, QObject* parent)
    : QAbstractTableModel(parent)
{
    initSettings(defaults);
}

QString VDRPrintTextModel::settingsGroup()
{
    const int language =
        QSettings().value(QStringLiteral("language"), int(QLocale::system().language())).toInt();
    return QStringLiteral("printTexts_%1").arg(language);
}

QString VDRPrintTextModel::text(int id) const
{
    if (id < 0 || id >= m_defaults.size())
        return QString();
    return m_replacements.at(id).isEmpty() ? m_defaults.at(id) : m_replacements.at(id);
}

void VDRPrintTextModel::initSettings(const QStringList& defaults)
{
    beginResetModel();
    m_defaults = defaults;
    m_replacements = QStringList();
    for (int i = 0; i < defaults.size(); ++i)
        m_replacements << QString();
    endResetModel();
}

void VDRPrintTextModel::readSettings()
{
    beginResetModel();
    for (QString& r : m_replacements)
        r.clear();
    QSettings settings;
    settings.beginGroup(settingsGroup());
    const int n = settings.beginReadArray(QStringLiteral("values"));
    for (int i = 0; i < n; ++i) {
        settings.setArrayIndex(i);
        const QString original = settings.value(QStringLiteral("centry")).toString();
        const QString replacement = settings.value(QStringLiteral("transEntry")).toString();
        // The same default may stand at several ids ("(siehe Fotos)"): each gets the replacement.
        for (int id = 0; id < m_defaults.size(); ++id)
            if (m_defaults.at(id) == original)
                m_replacements[id] = replacement;
    }
    settings.endArray();
    settings.endGroup();
    endResetModel();
}

void VDRPrintTextModel::writeSettings() const
{
    QSettings settings;
    settings.remove(settingsGroup());
    settings.beginGroup(settingsGroup());
    settings.setValue(QStringLiteral("version"), kVersion);
    settings.beginWriteArray(QStringLiteral("values"), m_defaults.size());
    for (int i = 0; i < m_defaults.size(); ++i) {
        settings.setArrayIndex(i);
        settings.setValue(QStringLiteral("centry"), m_defaults.at(i));
        settings.setValue(QStringLiteral("transEntry"), m_replacements.at(i));
    }
    settings.endArray();
    settings.endGroup();
}

QList<QPair<QString, QString>> VDRPrintTextModel::entries() const
{
    QList<QPair<QString, QString>> out;
    for (int i = 0; i < m_defaults.size(); ++i)
        out << qMakePair(m_defaults.at(i), m_replacements.at(i));
    return out;
}

int VDRPrintTextModel::rowCount(const QModelIndex& parent) const
{
    return parent.isValid() ? 0 : m_defaults.size();
}

int VDRPrintTextModel::columnCount(const QModelIndex& parent) const
{
    return parent.isValid() ? 0 : 2;
}

QVariant VDRPrintTextModel::data(const QModelIndex& index, int role) const
{
    if (!index.isValid() || index.row() >= m_defaults.size())
        return QVariant();
    if (role != Qt::DisplayRole && role != Qt::EditRole)
        return QVariant();
    return index.column() == 0 ? text(index.row()) : m_defaults.at(index.row());
}

QVariant VDRPrintTextModel::headerData(int section, Qt::Orientation orientation, int role) const
{
    if (orientation != Qt::Horizontal || role != Qt::DisplayRole)
        return QAbstractTableModel::headerData(section, orientation, role);
    return section == 0 ? tr("Druckausgabe") : tr("Vorlage");
}

Qt::ItemFlags VDRPrintTextModel::flags(const QModelIndex& index) const
{
    Qt::ItemFlags f = QAbstractTableModel::flags(index);
    if (index.isValid() && index.column() == 0)
        f |= Qt::ItemIsEditable;
    return f;
}

bool VDRPrintTextModel::setData(const QModelIndex& index, const QVariant& value, int role)
{
    if (!index.isValid() || index.column() != 0 || role != Qt::EditRole || index.row() >= m_defaults.size())
        return false;
    const QString newText = value.toString();
    if (newText == text(index.row()))
        return false;
    if (placeholders(newText) != placeholders(m_defaults.at(index.row()))) {
        const int answer = VDRPrompt::instance()->choose(
            VDRPrompt::Warning, tr("Fehler in Parametern"),
            tr("Anzahl oder Format der Parameter stimmt nicht!\nMöchten Sie den Text trotzdem ändern?"),
            {tr("Text ändern"), tr("Abbrechen")}, 1, 1);
        if (answer != 0)
            return false;
    }
    // The default itself needs no replacement; a deleted text is kept as a blank, since an empty
    // replacement means "none".
    if (newText == m_defaults.at(index.row()))
        m_replacements[index.row()].clear();
    else
        m_replacements[index.row()] = newText.isEmpty() ? QStringLiteral(" ") : newText;
    emit dataChanged(index, index);
    return true;
}
