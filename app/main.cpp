#include "app/KeyPressEater.h"
#include "app/MyProxyStyle.h"
#include "app/VDRApplication.h"
#include "app/VDRMainWindow.h"
#include "app/VDRSignalWatcher.h"
#include "app/VDRStartup.h"
#include "document/VDRDocument.h"
#include "editing/VDRWidgetPrompt.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRSpellChecker.h"
#include "editing/printdialogs/VDRPrintWidgets.h"

#include <QDir>
#include <QEvent>
#include <QLocale>
#include <QLockFile>
#include <QProcess>
#include <QSettings>
#include <QSqlDatabase>
#include <QTimer>

#include <functional>
#include <memory>

namespace {

const int kRestartExitCode = 1000;

// Runs a function once the window has been painted for the first time.
class AfterFirstPaint : public QObject
{
public:
    AfterFirstPaint(QWidget* window, std::function<void()> run) : QObject(window), m_run(std::move(run))
    {
        window->installEventFilter(this);
    }

    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() == QEvent::Paint && m_run) {
            watched->removeEventFilter(this);
            // Queued, so that the paint itself reaches the screen first.
            QTimer::singleShot(0, parent(), std::move(m_run));
            m_run = nullptr;
        }
        return false;
    }

private:
    std::function<void()> m_run;
};

} // namespace

int main(int argc, char* argv[])
{
    VDRApplication app(argc, argv);
    app.setStyle(new MyProxyStyle);
    QCoreApplication::addLibraryPath(QCoreApplication::applicationDirPath() + QStringLiteral("/plugins"));
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software"));
    QCoreApplication::setOrganizationDomain(QStringLiteral("korvant-software.de"));
    QCoreApplication::setApplicationName(QStringLiteral("Varduna"));
    QCoreApplication::setApplicationVersion(QStringLiteral(VARDUNA_VERSION));

    QSettings settings;
    // German, English and Spanish are served; any other system language starts in German.
    QLocale::Language systemLanguage = QLocale::system().language();
    if (systemLanguage != QLocale::English && systemLanguage != QLocale::Spanish)
        systemLanguage = QLocale::German;
    const int language = settings.value(QStringLiteral("language"), int(systemLanguage)).toInt();
    settings.setValue(QStringLiteral("language"), language);
    const auto chosen = QLocale::Language(language);
    const QLocale locale{chosen, chosen == QLocale::system().language() ? QLocale::system().country()
                                                                        : QLocale::AnyCountry};
    QLocale::setDefault(locale);
    VDRStartup::installTranslators(app, locale);

    VDRWidgetPrompt prompt;
    VDRPrompt::setInstance(&prompt);
    VDRPrintWidgets::install();

    const QString dictionaries = QCoreApplication::applicationDirPath() + QStringLiteral("/../Dictionaries/");
    const QString suffix = VDRSpellChecker::dictionarySuffix(locale.language(), locale.country());
    // Loaded once the window is shown: the dictionary takes longer than building the window. It
    // outlives the window, which points at it.
    std::unique_ptr<VDRSpellChecker> spellChecker;
    settings.remove(QStringLiteral("spellCheckerDialogX"));
    settings.remove(QStringLiteral("spellCheckerDialogY"));

    if (!QSqlDatabase::drivers().contains(QStringLiteral("QSQLITE"))) {
        VDRPrompt::critical(QObject::tr("Fehler"),
                            QObject::tr("Ihre QT-Installation unterstützt SQLITE nicht. Bitte "
                                        "kontaktieren Sie den Softwarehersteller."));
        return 1;
    }

    int result;
    {
        VDRMainWindow window;
        g_mainWindow = &window;
        prompt.setParentWidget(&window);
        std::unique_ptr<QLockFile> instanceClaim;
        const int instance = VDRStartup::claimInstance(QDir::tempPath(), instanceClaim);
        window.restoreWindowGeometry(settings.value(VDRMainWindow::geometrySettingsKey()).toByteArray(),
                                     settings.value(VDRMainWindow::windowStateSettingsKey()).toByteArray(),
                                     instance);
        new AfterFirstPaint(&window, [&] {
            spellChecker = std::make_unique<VDRSpellChecker>(dictionaries + QStringLiteral("vdr_") + suffix,
                                                             dictionaries + QStringLiteral("vdr_userDict_") +
                                                                 suffix + QStringLiteral(".txt"));
            window.setSpellChecker(spellChecker.get());
            // Nothing to migrate costs little, but a fresh store writes every default list.
            VDRCompleter::migrateSettings();
        });
        window.show();

        // Before the first document: a logout during a long opening must not kill us unprepared.
        VDRSignalWatcher watcher;
        QObject::connect(&watcher, &VDRSignalWatcher::terminationRequested, &window, [&window](int) {
            window.endSession();
            QCoreApplication::exit(0);
        });

        const QString file =
            VDRStartup::firstDocumentPath(app.fileToOpen(), settings, QCoreApplication::arguments().mid(1));
        const bool opened = VDRStartup::openFirstDocument(window, file);
        QObject::connect(&app, &QGuiApplication::lastWindowClosed, &app, &QCoreApplication::quit);
        QObject::connect(&app, &VDRApplication::fileOpenRequested, &window, [&window](const QString& path) {
            if (VDRStartup::isExchangeFile(path))
                VDRStartup::openFirstDocument(window, path);
            else
                window.openDocument(path, false, false);
        });

        if (!opened && settings.value(QStringLiteral("tips/showWelcomePageOnStart"), true).toBool())
            QTimer::singleShot(2000, &window, &VDRMainWindow::showWelcomePage);

        KeyPressEater eater;
        app.installEventFilter(&eater);

        result = app.exec();
        app.removeEventFilter(&eater);
    }
    VDRPrompt::setInstance(nullptr);

    if (result == kRestartExitCode) {
        const auto command = VDRStartup::restartCommand(QCoreApplication::arguments(),
                                                        QCoreApplication::applicationFilePath());
        QProcess::startDetached(command.first, command.second);
        return 0;
    }
    return result;
}
