#include "app/VDRStartup.h"

#include "app/VDRMainWindow.h"

#include <QFileInfo>
#include <QSettings>

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
    // The reports of an exchange file go into a new diary; the import itself comes with the exchange.
    if (QFileInfo(path).suffix().compare(QLatin1String("vdx"), Qt::CaseInsensitive) == 0)
        return window.createDocument(true);
    return window.openDocument(path, false, true) == 0;
}

QPair<QString, QStringList> VDRStartup::restartCommand(const QStringList& arguments,
                                                       const QString& executable)
{
    QStringList rest = arguments.mid(1);
    if (rest.isEmpty())
        return {executable, {}};
    const QString program = rest.takeFirst();
    return {program, rest};
}
