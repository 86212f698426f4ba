#pragma once

#include "editing/form/VDRRegisterNames.h"

#include <QStringList>

// One stored suggestion list as the editor shows and changes it.
class CompleterInfo
{
public:
    CompleterInfo() = default;
    CompleterInfo(VDRRegisterNames::RegisterNames regIdx, QString title, QString column, bool simple,
                  bool enabled, QStringList entries);

    VDRRegisterNames::RegisterNames registerIndex() const { return m_regIdx; }
    QString title() const { return m_title; }
    // "simple" for a whole-field list.
    QString column() const { return m_column; }
    bool isSimple() const { return m_simple; }
    bool isEnabled() const { return m_enabled; }
    void setEnabled(bool enabled);
    QStringList strings() const { return m_entries; }
    void setStrings(const QStringList& entries);
    // True once enabled or the entries were changed.
    bool isModified() const { return m_modified; }
    // "register - title" or "register - title - column"
    QString fieldText() const;

private:
    VDRRegisterNames::RegisterNames m_regIdx = VDRRegisterNames::Bautenstand;
    QString m_title;
    QString m_column;
    bool m_simple = true;
    bool m_enabled = true;
    QStringList m_entries;
    bool m_modified = false;
};
