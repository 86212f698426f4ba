#pragma once

#include <QPair>
#include <QString>
#include <QStringList>

class QSettings;
class VDRMainWindow;

// The decisions of start-up that do not need a running event loop, kept apart so tests can ask them.
class VDRStartup
{
public:
    static QString reopenSettingsKey() { return QStringLiteral("language/reopenFile"); }

    // The first document, by the first rule that applies: a file the desktop handed over, the
    // language dialog's re-open key (removed once read), a single argument, the argument after
    // "-file". Empty when none applies.
    static QString firstDocumentPath(const QString& desktopFile, QSettings& settings,
                                     const QStringList& arguments);

    // Opens it (an exchange file ".vdx" starts a new diary to import into); true when a document is open.
    static bool openFirstDocument(VDRMainWindow& window, const QString& path);

    // What to start when the event loop ended with the restart code: the first argument as program
    // and the rest as its arguments, or the program itself when it had none.
    static QPair<QString, QStringList> restartCommand(const QStringList& arguments,
                                                      const QString& executable);
};
