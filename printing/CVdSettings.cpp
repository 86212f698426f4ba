#include "printing/CVdSettings.h"

CVdSettings::CVdSettings(QObject* parent) : QSettings(parent) {}

void CVdSettings::save(const QString& key, const QVariant& value)
{
    setValue(key, value);
}

bool CVdSettings::read(const QString& key, QVariant& value) const
{
    if (!contains(key))
        return false;
    value = QSettings::value(key);
    return true;
}
