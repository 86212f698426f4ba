// Master data: the app's project data and companies into the diary, and the diary's for the app.
#include "sync/VDRReportSynchronisation.h"

int VDRReportSynchronisation::importMasterData(QSqlDatabase exchangeFile, const QString& path,
                                               bool& companiesChanged, bool& projectDataChanged)
{
    Q_UNUSED(exchangeFile)
    Q_UNUSED(path)
    companiesChanged = false;
    projectDataChanged = false;
    return 0;
}

bool VDRReportSynchronisation::exportMasterData4Synch(QSqlDatabase target)
{
    Q_UNUSED(target)
    return false;
}
