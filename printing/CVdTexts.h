#pragma once

#include <QObject>
#include <QStringList>

class VDRPrintTextModel;

// The numbered fixed texts of the printouts, each replaceable by the user.
class CVdTexts : public QObject
{
    Q_OBJECT
public:
    static CVdTexts* self();
    QString text(int id) const;
    // Defaults in the current language again, with the replacements stored for it.
    void resetModel();
    VDRPrintTextModel* model() const { return m_model; }

    QStringList TextList;

private:
    CVdTexts();
    VDRPrintTextModel* m_model = nullptr;
};
