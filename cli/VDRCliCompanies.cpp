#include "cli/VDRCliCompanies.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QTextStream>

int cliListCompanies(VDRDocument& doc, bool json, QTextStream& out)
{
    const QString separator = QStringLiteral(" ");
    const struct
    {
        const char* key;
        QString title;
        VDRSqlTableModel* model;
    } lists[] = {{"persons", QObject::tr("Am Bau beteiligte Personen"), doc.modelCompany1()},
                 {"companies", QObject::tr("Gewerke/Baufirmen"), doc.modelCompany2()}};

    QJsonObject result;
    for (const auto& list : lists) {
        VDRSqlTableModel* model = list.model;
        model->fetch_all();
        QJsonArray rows;
        if (!json)
            out << list.title << ":\n";
        for (int row = 0; row < model->rowCount(); ++row) {
            const int id = model->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
            const bool frozen = model->data(row, QStringLiteral("category"), Qt::EditRole).toInt() < 0;
            const QString format1 = CVdShared::getCompanyFormat1(model, row, separator);
            const QString format2 = CVdShared::getCompanyFormat2(model, row, separator);
            if (json) {
                QJsonObject company;
                company.insert(QStringLiteral("id"), id);
                company.insert(QStringLiteral("pos"),
                               model->data(row, QStringLiteral("pos"), Qt::EditRole).toInt());
                company.insert(QStringLiteral("frozen"), frozen);
                company.insert(QStringLiteral("format1"), format1);
                company.insert(QStringLiteral("format2"), format2);
                const QStringList& fields = CVdShared::listIdx2CompanyField();
                for (int f = 1; f < fields.size(); ++f)
                    company.insert(fields.at(f),
                                   model->data(row, fields.at(f), Qt::EditRole).toString().trimmed());
                rows.append(company);
            } else {
                out << id << '\t' << format1 << '\t' << format2;
                if (frozen)
                    out << '\t' << QObject::tr("(eingefroren)");
                out << '\n';
            }
        }
        result.insert(QLatin1String(list.key), rows);
    }
    if (json)
        out << QJsonDocument(result).toJson(QJsonDocument::Indented);
    out.flush();
    return 0;
}
