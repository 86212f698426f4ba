#pragma once

#include <QAbstractTableModel>
#include <QPair>
#include <QStringList>

// The print texts: one row per default text, column 0 the printed text (editable), column 1 the
// default. Replacements are stored per interface language.
class VDRPrintTextModel : public QAbstractTableModel
{
    Q_OBJECT
public:
    VDRPrintTextModel(const QStringList& defaults, QObject* parent);

    QString text(int id) const;
    void initSettings(const QStringList& defaults);
    void readSettings();
    void writeSettings() const;
    QList<QPair<QString, QString>> entries() const;
    QList<QPair<QString, QString>> getValues() const { return entries(); }

    // The settings group of the current interface language.
    static QString settingsGroup();

    int rowCount(const QModelIndex& parent = QModelIndex()) const override;
    int columnCount(const QModelIndex& parent = QModelIndex()) const override;
    QVariant data(const QModelIndex& index, int role) const override;
    QVariant headerData(int section, Qt::Orientation orientation, int role) const override;
    Qt::ItemFlags flags(const QModelIndex& index) const override;
    // Asks before storing a text whose placeholders differ from the default's.
    bool setData(const QModelIndex& index, const QVariant& value, int role = Qt::EditRole) override;

private:
    QStringList m_defaults;
    QStringList m_replacements;
};
