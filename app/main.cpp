#include "app/VDRMainWindow.h"
#include "document/VDRDocument.h"
#include "editing/VDRWidgetPrompt.h"

#include <QApplication>
#include <QSqlDatabase>

int main(int argc, char* argv[])
{
    QApplication app(argc, argv);
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software"));
    QCoreApplication::setOrganizationDomain(QStringLiteral("korvant-software.de"));
    QCoreApplication::setApplicationName(QStringLiteral("Varduna"));

    VDRWidgetPrompt prompt;
    VDRPrompt::setInstance(&prompt);

    if (!QSqlDatabase::drivers().contains(QStringLiteral("QSQLITE"))) {
        VDRPrompt::critical(QObject::tr("Fehler"), QObject::tr("Ihre QT-Installation unterstützt SQLITE nicht. Bitte "
                                                               "kontaktieren Sie den Softwarehersteller."));
        return 1;
    }

    int result;
    {
        VDRMainWindow window;
        g_mainWindow = &window;
        prompt.setParentWidget(&window);
        window.show();

        const QStringList args = QCoreApplication::arguments().mid(1);
        QString file;
        if (args.size() == 1)
            file = args.first();
        else if (const int i = args.indexOf(QStringLiteral("-file")); i >= 0 && i + 1 < args.size())
            file = args.at(i + 1);
        if (!file.isEmpty())
            window.openDocument(file);
        else
            window.createDocument();

        result = app.exec();
    }
    VDRPrompt::setInstance(nullptr);
    return result;
}
