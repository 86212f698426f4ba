#pragma once

#include <QCoreApplication>
#include <QList>
#include <QPair>
#include <QString>
#include <QStringList>

#include <memory>

class QLocale;
class QLockFile;
class QSettings;
class QTranslator;
class VDRMainWindow;

// The decisions of start-up that do not need a running event loop, kept apart so tests can ask them.
class VDRStartup
{
    Q_DECLARE_TR_FUNCTIONS(VDRStartup)
public:
    static QString reopenSettingsKey() { return QStringLiteral("language/reopenFile"); }

    // The first document, by the first rule that applies: a file the desktop handed over, the
    // language dialog's re-open key (removed once read), a single argument, the argument after
    // "-file". Empty when none applies.
    static QString firstDocumentPath(const QString& desktopFile, QSettings& settings,
                                     const QStringList& arguments);

    // Opens it; true when a document is open. An exchange file is imported into a new diary.
    static bool openFirstDocument(VDRMainWindow& window, const QString& path);

    // An exchange file (".vdx") of the mobile app.
    static bool isExchangeFile(const QString& path);
    // Says that the exchange file given at start-up is missing.
    static void refuseExchangeFile(const QString& path);

    // What to start when the event loop ended with the restart code: this very program, with the
    // arguments it was started with ('arguments' as QCoreApplication::arguments() gives them).
    static QPair<QString, QStringList> restartCommand(const QStringList& arguments,
                                                      const QString& executable);

    // Qt's own texts and the program's for the language of 'locale', from "../Translations" beside
    // the program; Qt's from the system where none lie there. Returns the translators installed.
    static QList<QTranslator*> installTranslators(QCoreApplication& app, const QLocale& locale);

    // Which running instance of this user this is (0 for the first), claimed in 'folder' for as long
    // as 'claim' lives; an instance that died frees its number.
    static int claimInstance(const QString& folder, std::unique_ptr<QLockFile>& claim);
};
