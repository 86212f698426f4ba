#include "sync/VDRReportSynchronisationResult.h"

VDRReportSynchronisationResult::VDRReportSynchronisationResult(const QString& path, const QString& number,
                                                               const QString& givenNumber,
                                                               const QString& userId, bool replaced,
                                                               int status, QObject* parent)
    : QObject(parent), m_path(path), m_number(number), m_givenNumber(givenNumber), m_userId(userId),
      m_replaced(replaced), m_status(status)
{
}
