#include "app/VDRStartup.h"

#include "app/VDRMainWindow.h"
#include "document/VDRPrompt.h"
#include "editing/completion/VDRSpellChecker.h"

#include <QDir>
#include <QFileInfo>
#include <QLibraryInfo>
#include <QLocale>
#include <QLockFile>
#include <QSettings>
#include <QTranslator>

QString VDRStartup::firstDocumentPath(const QString& desktopFile, QSettings& settings,
                                      const QStringList& arguments)
{
    if (!desktopFile.isEmpty())
        return desktopFile;
    if (settings.contains(reopenSettingsKey())) {
        const QString file = settings.value(reopenSettingsKey()).toString();
        settings.remove(reopenSettingsKey());
        if (!file.isEmpty())
            return file;
    }
    if (arguments.size() == 1)
        return arguments.first();
    const int i = arguments.indexOf(QStringLiteral("-file"));
    if (i >= 0 && i + 1 < arguments.size())
        return arguments.at(i + 1);
    return QString();
}

bool VDRStartup::openFirstDocument(VDRMainWindow& window, const QString& path)
{
    if (path.isEmpty())
        return false;
    if (isExchangeFile(path)) {
        if (!QFileInfo(path).isFile()) {
            refuseExchangeFile(path);
            return false;
        }
        // The app's reports go into a new diary, which the user then saves under a name.
        if (!window.createDocument(true))
            return false;
        window.importExchangeFile(QFileInfo(path).absoluteFilePath());
        return true;
    }
    return window.openDocument(path, false, true) == 0;
}

bool VDRStartup::isExchangeFile(const QString& path)
{
    return QFileInfo(path).suffix().compare(QLatin1String("vdx"), Qt::CaseInsensitive) == 0;
}

void VDRStartup::refuseExchangeFile(const QString& path)
{
    const QString native = QDir::toNativeSeparators(QFileInfo(path).absoluteFilePath());
    VDRPrompt::critical(tr("Dateifehler"), tr("Die Datei\n%1\nexistiert nicht.").arg(native));
}

QPair<QString, QStringList> VDRStartup::restartCommand(const QStringList& arguments,
                                                       const QString& executable)
{
    // The first argument is the name the program was called by; what follows are its arguments.
    return {executable, arguments.mid(1)};
}

QList<QTranslator*> VDRStartup::installTranslators(QCoreApplication& app, const QLocale& locale)
{
    const QString base = QCoreApplication::applicationDirPath();
    const QString language = VDRSpellChecker::translationLanguage(locale.language(), locale.country());
    const QString translations = base + QStringLiteral("/../Translations");
    const QString system = QLibraryInfo::location(QLibraryInfo::TranslationsPath);
    const struct
    {
        QString name;
        QString folder;
        // Tried when the first is not there: Qt's own texts as the system ships them.
        QString fallbackName;
        QString fallbackFolder;
    } files[] = {{QStringLiteral("qt_") + locale.name(), translations,
                  QStringLiteral("qtbase_") + locale.name(), system},
                 {QStringLiteral("qtBase_") + locale.name(), translations, QString(), QString()},
                 {QStringLiteral("ncreport_") + language, base + QStringLiteral("/../NCreport/i18n"),
                  QString(), QString()},
                 {QStringLiteral("vdr_") + language, translations, QString(), QString()}};
    QList<QTranslator*> installed;
    for (const auto& file : files) {
        auto* translator = new QTranslator(&app);
        // A missing translation leaves the source texts; it must not stop the start.
        if (translator->load(file.name, file.folder) ||
            (!file.fallbackName.isEmpty() && translator->load(file.fallbackName, file.fallbackFolder))) {
            QCoreApplication::installTranslator(translator);
            installed << translator;
        } else {
            delete translator;
        }
    }
    return installed;
}

int VDRStartup::claimInstance(const QString& folder, std::unique_ptr<QLockFile>& claim)
{
    // Per user: the home folder tells users apart where they share the temporary folder.
    const QString user = QString::number(qHash(QDir::homePath()), 16);
    for (int instance = 0; instance < 16; ++instance) {
        auto lock = std::make_unique<QLockFile>(
            QDir(folder).filePath(QStringLiteral("varduna-%1-%2.lock").arg(user).arg(instance)));
        // Only a lock whose process is gone is stale, however long ago it was taken.
        lock->setStaleLockTime(0);
        if (lock->tryLock(0)) {
            claim = std::move(lock);
            return instance;
        }
    }
    return 0;
}
