#include "editing/completion/CompleterInfo.h"

CompleterInfo::CompleterInfo(VDRRegisterNames::RegisterNames regIdx, QString title, QString column,
                             bool simple, bool enabled, QStringList entries)
    : m_regIdx(regIdx), m_title(std::move(title)), m_column(std::move(column)), m_simple(simple),
      m_enabled(enabled), m_entries(std::move(entries))
{
}

void CompleterInfo::setEnabled(bool enabled)
{
    if (enabled != m_enabled) {
        m_enabled = enabled;
        m_modified = true;
    }
}

void CompleterInfo::setStrings(const QStringList& entries)
{
    if (entries != m_entries) {
        m_entries = entries;
        m_modified = true;
    }
}

QString CompleterInfo::fieldText() const
{
    const QString reg = VDRRegisterNames::registerName(m_regIdx);
    if (m_simple)
        return QStringLiteral("%1 - %2").arg(reg, m_title);
    return QStringLiteral("%1 - %2 - %3").arg(reg, m_title, m_column);
}
