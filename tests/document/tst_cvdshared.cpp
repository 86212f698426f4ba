#include "VDRTestCase.h"
#include "document/CVdShared.h"
#include "document/VDRDocument.h"

#include <QSettings>
#include <QtTest>

class TestCVdShared : public VDRTestCase
{
    Q_OBJECT

private slots:
    void formats_data();
    void formats();
    void modelRowsAndFieldNames();
    void settingsAndReset();
};

void TestCVdShared::formats_data()
{
    QTest::addColumn<int>("format");
    QTest::addColumn<QList<int>>("fields");
    QTest::addColumn<bool>("bracketA");
    QTest::addColumn<bool>("bracketB");
    QTest::addColumn<QString>("separator");
    QTest::addColumn<QString>("company");
    QTest::addColumn<QString>("lastname");
    QTest::addColumn<QString>("type");
    QTest::addColumn<QString>("expected");

    const QString c = QStringLiteral("Mustermann & Söhne"), l = QStringLiteral("Mustermann"),
                  t = QStringLiteral("Architekt"), s = QStringLiteral(" ");
    const QList<int> f1{0, 4, 1}, f2{0, 3, 4, 1};
    // clang-format off
    QTest::newRow("company default") << 1 << f1 << false << true << s << c << l << t << "Mustermann & Söhne (Architekt)";
    QTest::newRow("person default") << 2 << f2 << false << true << s << c << l << t << "Mustermann Mustermann & Söhne (Architekt)";
    QTest::newRow("both brackets") << 1 << f1 << true << true << s << c << l << t << "(Mustermann & Söhne, Architekt)";
    QTest::newRow("only type, company") << 1 << f1 << false << true << s << "" << "" << t << "(Architekt)";
    QTest::newRow("only type, person") << 2 << f2 << false << true << s << "" << "" << t << "(Architekt)";
    QTest::newRow("blanks count as empty") << 2 << f2 << false << true << s << " " << " " << t << "(Architekt)";
    QTest::newRow("all positions empty") << 2 << QList<int>{0, 0, 0, 0} << true << true << s << c << l << t << "";
    QTest::newRow("all values empty") << 1 << f1 << true << true << s << "" << "" << "" << "";
    QTest::newRow("no brackets") << 1 << f1 << false << false << s << c << l << t << "Mustermann & Söhne Architekt";
    QTest::newRow("no brackets, 2 empty") << 1 << f1 << false << false << s << "" << l << t << "Architekt";
    QTest::newRow("first bracket") << 1 << f1 << true << false << s << c << l << t << "(Mustermann & Söhne) Architekt";
    QTest::newRow("first bracket, 2 empty") << 1 << f1 << true << false << s << "" << l << t << "Architekt";
    QTest::newRow("first bracket, 3 empty") << 1 << f1 << true << false << s << c << l << "" << "(Mustermann & Söhne)";
    QTest::newRow("second bracket, 3 empty") << 1 << f1 << false << true << s << c << l << "" << "Mustermann & Söhne";
    QTest::newRow("both brackets, 2 empty") << 1 << f1 << true << true << s << "" << l << t << "(Architekt)";
    QTest::newRow("both brackets, 3 empty") << 1 << f1 << true << true << s << c << l << "" << "(Mustermann & Söhne)";
    QTest::newRow("both brackets after a name") << 1 << QList<int>{3, 4, 1} << true << true << s << c << l << t << "Mustermann (Mustermann & Söhne, Architekt)";
    QTest::newRow("both brackets, name only") << 1 << QList<int>{3, 4, 1} << true << true << s << "" << l << "" << "Mustermann";
    QTest::newRow("person, 1 and 2 joined") << 2 << QList<int>{4, 3, 0, 1} << false << true << s << c << l << t << "Mustermann & Söhne Mustermann (Architekt)";
    QTest::newRow("person, leading empty") << 2 << QList<int>{4, 3, 0, 1} << false << true << s << "" << l << "" << "Mustermann";
    QTest::newRow("double blank") << 1 << f1 << true << true << "  " << c << l << t << "(Mustermann & Söhne,  Architekt)";
    QTest::newRow("line feed") << 1 << f1 << true << true << "\n" << c << l << t << "(Mustermann & Söhne\nArchitekt)";
    QTest::newRow("loose values know three fields") << 2 << QList<int>{2, 5, 7, 11} << true << true << s << c << l << t << "";
    // clang-format on
}

void TestCVdShared::formats()
{
    QFETCH(int, format);
    QFETCH(QList<int>, fields);
    QFETCH(bool, bracketA);
    QFETCH(bool, bracketB);
    QFETCH(QString, separator);
    QFETCH(QString, company);
    QFETCH(QString, lastname);
    QFETCH(QString, type);
    QFETCH(QString, expected);

    if (format == 1) {
        CVdShared::setCompanyOutputFormat1FieldIdx1(fields[0]);
        CVdShared::setCompanyOutputFormat1FieldIdx2(fields[1]);
        CVdShared::setCompanyOutputFormat1FieldIdx3(fields[2]);
        CVdShared::setCompanyOutputFormat1Field2InBrackets(bracketA);
        CVdShared::setCompanyOutputFormat1Field3InBrackets(bracketB);
        QCOMPARE(CVdShared::getCompanyFormat1(company, lastname, type, separator), expected);
    } else {
        CVdShared::setCompanyOutputFormat2FieldIdx1(fields[0]);
        CVdShared::setCompanyOutputFormat2FieldIdx2(fields[1]);
        CVdShared::setCompanyOutputFormat2FieldIdx3(fields[2]);
        CVdShared::setCompanyOutputFormat2FieldIdx4(fields[3]);
        CVdShared::setCompanyOutputFormat2Field3InBrackets(bracketA);
        CVdShared::setCompanyOutputFormat2Field4InBrackets(bracketB);
        QCOMPARE(CVdShared::getCompanyFormat2(company, lastname, type, separator), expected);
    }
    // The field map gives the same text with blanks.
    if (separator == QLatin1String(" ")) {
        const QMap<QString, QString> map{{"company", company}, {"lastname", lastname}, {"type", type}};
        const QString report = format == 1 ? CVdShared::getCompany4ReportFormat1(map, true)
                                           : CVdShared::getCompany4ReportFormat2(map, true);
        QCOMPARE(report, expected);
    }
}

void TestCVdShared::modelRowsAndFieldNames()
{
    VDRDocument doc;
    QVERIFY(doc.createDocument(true));
    CVdShared::resetCompanyOutputFormat1();
    CVdShared::resetCompanyOutputFormat2();

    VDRSqlTableModel* model = doc.modelCompany2();
    QVERIFY(doc.appendCompany2());
    const int row = model->rowCount() - 1;
    const QHash<QString, QString> values{{"type", "Architekt"},          {"firstname", "Karl"},
                                         {"lastname", "Mustermann"},     {"company", "Mustermann & Söhne"},
                                         {"street", "Musterstraße. 99"}, {"email", "karl@example.org"}};
    for (auto it = values.begin(); it != values.end(); ++it)
        QVERIFY(model->setData(row, it.key(), it.value()));
    QVERIFY(model->submitAll());

    QCOMPARE(CVdShared::getCompanyFormat1(model, row, " "), QString("Mustermann & Söhne (Architekt)"));
    QCOMPARE(CVdShared::getCompanyFormat2(model, row, " "),
             QString("Mustermann Mustermann & Söhne (Architekt)"));
    QCOMPARE(CVdShared::getCompanyFormat1(model, -1, " "), QString());
    QCOMPARE(CVdShared::getCompanyFormat1(model, row + 1, " "), QString());
    QCOMPARE(CVdShared::getCompanyFormat2(nullptr, 0, " "), QString());
    // Fields beyond the three loose ones come from the row.
    CVdShared::setCompanyOutputFormat2FieldIdx1(2);
    CVdShared::setCompanyOutputFormat2FieldIdx4(11);
    QCOMPARE(CVdShared::getCompanyFormat2(model, row, " "),
             QString("Karl Mustermann Mustermann & Söhne (karl@example.org)"));
    QCOMPARE(CVdShared::getCompany4ReportFormat2({{"firstname", "Karl"},
                                                  {"lastname", "Mustermann"},
                                                  {"company", "Mustermann & Söhne"},
                                                  {"email", "k@x"}},
                                                 false),
             QString("Karl Mustermann Mustermann & Söhne"));

    QCOMPARE(CVdShared::getCompanyFormat2OutputFieldName1() + "|" +
                 CVdShared::getCompanyFormat1OutputFieldName1() + "|" +
                 CVdShared::getCompanyFormat1OutputFieldName2(),
             QString("firstname||company")); // "- leer -" has no column
    for (int i = 0; i < 12; ++i)
        QCOMPARE(CVdShared::getListIdxByCompanyField(CVdShared::getCompanyFieldByIndex(i)), i);
    QCOMPARE(CVdShared::getCompanyFieldByIndex(12), QString());
    QCOMPARE(CVdShared::getListIdxByCompanyField("pos"), -1);
}

void TestCVdShared::settingsAndReset()
{
    // Fields and bracket flags of both formats in one text: "0 4 1 (01) | 0 3 4 1 (01)".
    auto state = [] {
        using S = CVdShared;
        return QString("%1 %2 %3 (%4%5) | %6 %7 %8 %9 (%10%11)")
            .arg(S::companyOutputFormat1FieldIdx1())
            .arg(S::companyOutputFormat1FieldIdx2())
            .arg(S::companyOutputFormat1FieldIdx3())
            .arg(S::companyOutputFormat1Field2InBrackets())
            .arg(S::companyOutputFormat1Field3InBrackets())
            .arg(S::companyOutputFormat2FieldIdx1())
            .arg(S::companyOutputFormat2FieldIdx2())
            .arg(S::companyOutputFormat2FieldIdx3())
            .arg(S::companyOutputFormat2FieldIdx4())
            .arg(S::companyOutputFormat2Field3InBrackets())
            .arg(S::companyOutputFormat2Field4InBrackets());
    };
    const QString defaults = "0 4 1 (01) | 0 3 4 1 (01)";
    QSettings settings;
    settings.remove("CompanyOutputFormats");
    CVdShared::restoreCompanyOutputFormats();
    QCOMPARE(state(), defaults);

    // Stored values are used; one out of range falls back to its default.
    settings.setValue("CompanyOutputFormats/format1Field1", 7);
    settings.setValue("CompanyOutputFormats/format1Field2", 99);
    settings.setValue("CompanyOutputFormats/format2Field4InBrackets", false);
    CVdShared::restoreCompanyOutputFormats();
    QCOMPARE(state(), QString("7 4 1 (01) | 0 3 4 1 (00)"));

    CVdShared::setCompanyOutputFormat1Field2InBrackets(true);
    CVdShared::setCompanyOutputFormat2FieldIdx2(11);
    CVdShared::saveCompanyOutputFormats();
    // Resetting restores the defaults and touches no settings until they are saved.
    CVdShared::resetCompanyOutputFormat1();
    CVdShared::resetCompanyOutputFormat2();
    QCOMPARE(state(), defaults);
    CVdShared::restoreCompanyOutputFormats();
    QCOMPARE(state(), QString("7 4 1 (11) | 0 11 4 1 (00)"));
    settings.remove("CompanyOutputFormats");
    CVdShared::restoreCompanyOutputFormats();
}

QTEST_MAIN(TestCVdShared)
#include "tst_cvdshared.moc"
