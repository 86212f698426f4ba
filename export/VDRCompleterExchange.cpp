#include "VDRCompleterExchange.h"

#include "VDRSettingsXml.h"
#include "document/VDRPrompt.h"

#include <QDateTime>
#include <QDir>
#include <QFileInfo>
#include <QLocale>
#include <QSaveFile>
#include <QSettings>

const QString VDRCompleterExchange::LastSyncCompleterSettingsKey =
    QStringLiteral("syncCompleter/lastSyncCompleter");

namespace {

struct Language
{
    const char* fileGroup;
    QLocale::Language locale;
};

// The exchange file's languages in its own order. "USA" shares English's locale number and thus its
// lists: they are written under both names, and read from "English", or from "USA" when the file has
// no "English".
const Language Languages[] = {
    {"German", QLocale::German},     {"English", QLocale::English}, {"Spanish", QLocale::Spanish},
    {"Romanian", QLocale::Romanian}, {"USA", QLocale::English},     {"Greek", QLocale::Greek},
    {"Russian", QLocale::Russian},   {"Finnish", QLocale::Finnish},
};
const char* const UsaFileGroup = "USA";

void (*listsReplacedHandler)() = nullptr;

// The file holds only text; restore the types the completers write, so a store that keeps types
// (the macOS property list) looks as before.
QVariant typedValue(const QString& key, const QVariant& value)
{
    const QString name = key.section(QLatin1Char('/'), -1);
    const QString text = value.toString();
    if (name == QLatin1String("enabled") || name == QLatin1String("init")) {
        if (text == QLatin1String("true") || text == QLatin1String("false"))
            return text == QLatin1String("true");
    } else if (name == QLatin1String("tableID") || name == QLatin1String("regIdx") ||
               name == QLatin1String("columnID") || name == QLatin1String("size")) {
        bool ok = false;
        const int number = text.toInt(&ok);
        if (ok)
            return number;
    }
    return value;
}

// The keys of 'group' in the file map, without the group's name.
QSettings::SettingsMap fileGroup(const QSettings::SettingsMap& map, const QString& group)
{
    QSettings::SettingsMap keys;
    const QString prefix = group + QLatin1Char('/');
    for (auto it = map.lowerBound(prefix); it != map.constEnd() && it.key().startsWith(prefix); ++it)
        keys.insert(it.key().mid(prefix.size()), it.value());
    return keys;
}

} // namespace

QString VDRCompleterExchange::completerFilePath(const QString& folder)
{
    return QDir(folder).filePath(QStringLiteral("Completer.xml"));
}

QString VDRCompleterExchange::completerGroup(int localeLanguage)
{
    return QStringLiteral("completer_%1").arg(localeLanguage);
}

void VDRCompleterExchange::recordSyncDate(const QString& path)
{
    QDateTime modified = QFileInfo(path).lastModified();
    // File systems with second precision must compare equal.
    modified = modified.addMSecs(-modified.time().msec());
    QSettings().setValue(LastSyncCompleterSettingsKey, modified);
}

bool VDRCompleterExchange::exportSettings2XML(const QString& folder)
{
    xmlSettingsFormat();
    QSettings settings;
    QSettings::SettingsMap map;
    for (const Language& language : Languages) {
        settings.beginGroup(completerGroup(language.locale));
        const QStringList keys = settings.allKeys();
        for (const QString& key : keys)
            map.insert(QLatin1String(language.fileGroup) + QLatin1Char('/') + key, settings.value(key));
        settings.endGroup();
    }

    // Written whole through a temporary file: the cloud client never sees half a file.
    const QString path = completerFilePath(folder);
    QSaveFile file(path);
    if (!file.open(QIODevice::WriteOnly) || !writeXmlFile(file, map) || !file.commit())
        return false;
    recordSyncDate(path);
    return true;
}

bool VDRCompleterExchange::importSettingsFromXML(const QString& folder)
{
    const QString path = completerFilePath(folder);
    if (!QFileInfo::exists(path))
        return false;
    QSettings::SettingsMap map;
    QString error;
    if (!readXmlSettingsFile(path, map, &error)) {
        VDRPrompt::critical(
            tr("Fehler bei Synchronisation der Autovervollständigen-Texte"),
            tr("Fehler beim Lesen der Austausch-Datei für Autovervollständigen-Texte\n%1:\n%2\n\nDie "
               "Autovervollständigen-Texte konnten nicht synchronisiert werden.")
                .arg(QDir::toNativeSeparators(path), error));
        return false;
    }

    QSettings settings;
    for (const Language& language : Languages) {
        if (qstrcmp(language.fileGroup, UsaFileGroup) == 0)
            continue;
        QSettings::SettingsMap keys = fileGroup(map, QLatin1String(language.fileGroup));
        if (keys.isEmpty() && language.locale == QLocale::English)
            keys = fileGroup(map, QLatin1String(UsaFileGroup));
        if (keys.isEmpty())
            continue;
        // The file's lists replace the language's own, with all their keys (enabled, regIdx, ...).
        const QString group = completerGroup(language.locale);
        settings.remove(group);
        settings.beginGroup(group);
        for (auto it = keys.constBegin(); it != keys.constEnd(); ++it)
            settings.setValue(it.key(), typedValue(it.key(), it.value()));
        settings.endGroup();
    }
    settings.sync();
    recordSyncDate(path);
    // Live lists would otherwise write their old entries back over the imported ones.
    if (listsReplacedHandler)
        listsReplacedHandler();
    return true;
}

void VDRCompleterExchange::setListsReplacedHandler(void (*handler)())
{
    listsReplacedHandler = handler;
}

bool VDRCompleterExchange::createCompleterXMLFile(const QString& folder)
{
    if (QFileInfo::exists(completerFilePath(folder)))
        return true;
    return exportSettings2XML(folder);
}
