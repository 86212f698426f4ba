#pragma once

#include <QSqlQueryModel>

// The companies of both lists for the project party choosers, each shown as one line: first and
// last name, the company, the type in brackets. The frozen copies of locked reports are left out:
// they repeat a company of the lists.
class AllCompanyModel : public QSqlQueryModel
{
    Q_OBJECT
public:
    AllCompanyModel(QObject* parent, QSqlDatabase db);

    // Reads the companies again.
    void refresh();
    // -1 for a row out of range / for an id that is not listed.
    int getIdForIndex(int row) const;
    int getIndexForId(int id) const;

    static QString partyText(const QString& firstname, const QString& lastname, const QString& company,
                             const QString& type);

    QVariant data(const QModelIndex& index, int role = Qt::DisplayRole) const override;

private:
    QSqlDatabase m_db;
};
