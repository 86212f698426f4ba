#pragma once

#include <QObject>
#include <QString>

// What became of one report of an exchange file, for the summary of an import run.
class VDRReportSynchronisationResult : public QObject
{
    Q_OBJECT
public:
    enum Status
    {
        Imported = 1,
        RefusedLocked = -1,
        RefusedDatabaseError = -2,
        RefusedNewerVersion = -4,
        RefusedDeleted = -5,
    };

    VDRReportSynchronisationResult(const QString& path, const QString& number, const QString& givenNumber,
                                   const QString& userId, bool replaced, int status,
                                   QObject* parent = nullptr);

    QString path() const { return m_path; }
    // The number as the exchange file has it, trailing blanks removed.
    QString number() const { return m_number; }
    // The number the report got in the diary; the file's number when it kept it.
    QString givenNumber() const { return m_givenNumber.isEmpty() ? m_number : m_givenNumber; }
    void setGivenNumber(const QString& number) { m_givenNumber = number; }
    QString userId() const { return m_userId; }
    bool replaced() const { return m_replaced; }
    void setReplaced(bool replaced) { m_replaced = replaced; }
    int status() const { return m_status; }
    void setStatus(int status) { m_status = status; }

private:
    QString m_path;
    QString m_number;
    QString m_givenNumber;
    QString m_userId;
    bool m_replaced;
    int m_status;
};
