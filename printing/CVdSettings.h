#pragma once

#include <QSettings>
#include <QVariant>

// The program's settings store with the two calls the printouts use.
class CVdSettings : public QSettings
{
    Q_OBJECT
public:
    explicit CVdSettings(QObject* parent = nullptr);

    void save(const QString& key, const QVariant& value);
    // False when the key is absent; the caller then keeps its default in 'value'.
    bool read(const QString& key, QVariant& value) const;
};
