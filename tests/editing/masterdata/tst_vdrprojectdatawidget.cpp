#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "editing/masterdata/VDRProjectDataWidget.h"
#include "editing/tables/VDRTableView.h"

#include <QCheckBox>
#include <QComboBox>
#include <QLineEdit>
#include <QMimeData>
#include <QPushButton>
#include <QSettings>
#include <QTabWidget>
#include <QTableView>
#include <QTextEdit>
#include <QToolButton>
#include <QtTest>

#include <memory>

using namespace VDRTestFixtures;

class TestVDRProjectDataWidget : public VDRTestCase
{
    Q_OBJECT

    void initTest() override;
    void cleanupTest() override;

private slots:
    void okWritesAbbrechenReverts_data();
    void okWritesAbbrechenReverts();
    void partyChooserOfRemovedCompany();
    void companyLists();
    void formatTab_data();
    void formatTab();

private:
    QStringList rows(const QString& sql) { return textsOn(m_doc->database(), sql); }
    void exec(const QString& sql) { QVERIFY(execOn(m_doc->database(), {sql})); }
    std::unique_ptr<VDRProjectDataWidget> openWidget(int tab);
    template <class T> T* child(const char* name) { return m_widget->findChild<T*>(QLatin1String(name)); }

    std::unique_ptr<VDRDocument> m_doc;
    std::unique_ptr<VDRProjectDataWidget> m_widget;
};

void TestVDRProjectDataWidget::initTest()
{
    QSettings().clear();
    CVdShared::restoreCompanyOutputFormats();
    m_doc = std::make_unique<VDRDocument>();
    QVERIFY(m_doc->createDocument(true));
}

void TestVDRProjectDataWidget::cleanupTest()
{
    m_widget.reset();
    m_doc.reset();
}

std::unique_ptr<VDRProjectDataWidget> TestVDRProjectDataWidget::openWidget(int tab)
{
    auto widget = std::make_unique<VDRProjectDataWidget>();
    widget->slotDocumentOpened(m_doc.get());
    widget->activateTab(VDRProjectDataWidget::SettingsType(tab));
    widget->show();
    return widget;
}

void TestVDRProjectDataWidget::okWritesAbbrechenReverts_data()
{
    QTest::addColumn<QString>("button");
    QTest::addColumn<bool>("written");
    QTest::newRow("OK") << "pbOk" << true;
    QTest::newRow("Abbrechen") << "pbCancel" << false;
}

void TestVDRProjectDataWidget::okWritesAbbrechenReverts()
{
    QFETCH(QString, button);
    QFETCH(bool, written);
    const QString sql =
        "SELECT name, projectnumber, headline_left, headline_center, headline_right, footer_left, "
        "show_projectname, show_projectaddress, projectaddress, show_address2, address2 FROM vdr";
    const QStringList before = rows(sql);
    exec("UPDATE company SET firstname='Eva', lastname='Bau' WHERE type='Bauleitung'");
    const int companyRows = rows("SELECT id FROM company").size();

    m_widget = openWidget(0);
    QCOMPARE(child<QTabWidget>("tabWidget")->currentIndex(), 0);
    QCOMPARE(child<QLineEdit>("lineEditProjectname")->text(), QString("Neues Varduna"));
    child<QLineEdit>("lineEditProjectname")->setText("Rathaus Neubau");
    child<QLineEdit>("lineEditProjectNumber")->setText("R-17");
    child<QLineEdit>("lineEditHeadlineLeft")->setText("Links");
    child<QLineEdit>("lineEditHeadlineCenter")->setText(QString());
    child<QLineEdit>("lineEditHeadlineRight")->setText("Rechts");
    child<QLineEdit>("lineEditFooterLeft")->setText("Fuß");
    child<QCheckBox>("cb_projectname")->setChecked(true);
    child<QCheckBox>("cb_projectaddress")->setChecked(true);
    child<QTextEdit>("te_projectaddress")->setPlainText("Marktplatz 1\n12345 Musterstadt");
    child<QCheckBox>("cb_address2")->setChecked(true);
    auto* party = child<QComboBox>("combo_address2");
    const int partyRow = party->findText("Eva Bau (Bauleitung)");
    QVERIFY(partyRow >= 0);
    party->setCurrentIndex(partyRow);
    // A new company row that Abbrechen must drop as well.
    m_widget->activateTab(VDRProjectDataWidget::ST_COMPANYLIST);
    m_widget->tableViewCompanies2()->buttonAdd()->click();
    child<QPushButton>(qPrintable(button))->click();
    QVERIFY(!m_widget->isVisible());

    if (written) {
        const QString bauleitung = rows("SELECT id FROM company WHERE type='Bauleitung'").value(0);
        QCOMPARE(rows(sql), QStringList("Rathaus Neubau|R-17|Links||Rechts|Fuß|1|1|Marktplatz 1\n12345 "
                                        "Musterstadt|1|" +
                                        bauleitung));
        QCOMPARE(rows("SELECT id FROM company").size(), companyRows + 1);
        QVERIFY(m_doc->isStateModified());
    } else {
        QCOMPARE(rows(sql), before);
        QCOMPARE(rows("SELECT id FROM company").size(), companyRows);
        QCOMPARE(m_doc->modelCompany2()->rowCount(), 0);
    }
}

void TestVDRProjectDataWidget::partyChooserOfRemovedCompany()
{
    exec("UPDATE vdr SET address1 = 4711, show_address1 = 1");
    m_widget = openWidget(0);
    auto* party = child<QComboBox>("combo_address1");
    QVERIFY(party->count() >= 3);
    QCOMPARE(party->currentIndex(), -1);
    QCOMPARE(party->currentText(), QString());
    child<QPushButton>("pbOk")->click();
    QCOMPARE(rows("SELECT address1, show_address1 FROM vdr"), QStringList("-1|1"));
}

void TestVDRProjectDataWidget::companyLists()
{
    // A frozen copy is listed beside the list's own rows.
    exec("INSERT INTO company (id, category, type, firstname, lastname, company, street, plz, city, "
         "telephone, "
         "telefax, mobile, email, pos) VALUES (900, -1, 'Prüfer', '', 'Alt', '', '', '', '', '', '', '', '', "
         "0)");
    m_widget = openWidget(1);
    QCOMPARE(child<QTabWidget>("tabWidget")->currentIndex(), 1);
    auto* persons = child<QTableView>("tableViewCompanies1");
    QCOMPARE(persons->model()->rowCount(), 4);
    // Rows come in their stored order: the frozen copy has the lowest pos.
    auto* model = m_doc->modelCompany1();
    QCOMPARE(model->data(0, "lastname", Qt::EditRole).toString(), QString("Alt"));
    QCOMPARE(model->data(1, "type", Qt::EditRole).toString(), QString("Bauherr"));

    // Cells are edited in place; a 10,000 character name is cut to the column's size.
    const QModelIndex cell = model->index(1, "company");
    persons->setCurrentIndex(cell);
    persons->edit(cell);
    auto* editor = qobject_cast<QLineEdit*>(persons->indexWidget(cell));
    QVERIFY(editor);
    editor->setText(QString(10000, QChar('M')));
    // The frozen copy takes no editor.
    persons->edit(model->index(0, "company"));
    QVERIFY(!persons->indexWidget(model->index(0, "company")));

    // The frozen copy cannot be removed; removing from list 1 asks first, "No" keeps the row.
    persons->selectRow(0);
    m_prompt.expect("Eintrag entfernen", "von abgeschlossenen Berichten verwendet");
    m_widget->tableViewCompanies1()->buttonDelete()->click();
    persons->selectRow(2);
    QToolButton* remove = m_widget->tableViewCompanies1()->buttonDelete();
    m_prompt.expect("Eintrag entfernen", "Soll der gewählte Eintrag tatsächlich entfernt werden?",
                    VDRPrompt::No);
    remove->click();
    QCOMPARE(persons->model()->rowCount(), 4);
    persons->selectRow(2);
    m_prompt.expect("Eintrag entfernen", "Soll der gewählte Eintrag tatsächlich entfernt werden?",
                    VDRPrompt::Yes);
    remove->click();

    int personsCount = 0, companies = 0;
    m_widget->countCompanyEntries(personsCount, companies);
    QCOMPARE(personsCount, 2);
    QCOMPARE(companies, 0);
    child<QPushButton>("pbOk")->click();
    QCOMPARE(rows("SELECT type, length(company) FROM company WHERE category = 1 ORDER BY pos"),
             QStringList({"Bauherr|128", "Architekt|0"}));
    QVERIFY(QSettings().contains("Geometries/ProjectData/Company1ColumnWidths"));

    // Reopened, the list has the stored widths; dragging the last person above the first reorders it.
    QSettings().setValue(
        "Geometries/ProjectData/Company1ColumnWidths",
        QStringList({"0", "0", "77", "66", "55", "44", "33", "22", "11", "20", "30", "35", "40"}));
    m_widget = openWidget(1);
    QCOMPARE(m_widget->tableViewCompanies1()->columnWidth(model->fieldIndex("type")), 77);
    QCOMPARE(m_widget->tableViewCompanies1()->columnWidth(model->fieldIndex("email")), 40);
    std::unique_ptr<QMimeData> drag(model->mimeData({model->index(2, "type")}));
    QVERIFY(model->dropMimeData(drag.get(), Qt::MoveAction, 1, 0, QModelIndex()));
    child<QPushButton>("pbOk")->click();
    QCOMPARE(rows("SELECT type FROM company WHERE category = 1 ORDER BY pos"),
             QStringList({"Architekt", "Bauherr"}));
}

void TestVDRProjectDataWidget::formatTab_data()
{
    QTest::addColumn<QString>("button");
    QTest::addColumn<bool>("saved");
    QTest::newRow("OK") << "pbOk" << true;
    QTest::newRow("Abbrechen") << "pbCancel" << false;
}

void TestVDRProjectDataWidget::formatTab()
{
    QFETCH(QString, button);
    QFETCH(bool, saved);
    m_widget = openWidget(2);
    auto* example1 = child<QLineEdit>("lineEditFormat1Example");
    auto* example2 = child<QLineEdit>("lineEditFormat2Example");
    QCOMPARE(example1->text(), QString("Mustermann & Söhne (Architekt)"));
    QCOMPARE(example2->text(), QString("Mustermann Mustermann & Söhne (Architekt)"));
    QCOMPARE(child<QComboBox>("cbFormat1Field1")->currentText(), QString("- leer -"));
    QVERIFY(child<QComboBox>("cbFormat2Field4")
                ->toolTip()
                .startsWith("Wählen Sie Feld 4 des personenbezogenen "
                            "Formats.\nDieses Feld wird in Klammern"));

    child<QCheckBox>("cbFormat1Field2InBrackets")->setChecked(true);
    QCOMPARE(example1->text(), QString("(Mustermann & Söhne, Architekt)"));
    child<QComboBox>("cbFormat2Field1")->setCurrentIndex(2); // first name
    QCOMPARE(example2->text(), QString("Karl Mustermann Mustermann & Söhne (Architekt)"));
    // Reset restores format 2 only; format 1 keeps its change.
    child<QPushButton>("pbFormat2Defaults")->click();
    QCOMPARE(example2->text(), QString("Mustermann Mustermann & Söhne (Architekt)"));
    child<QComboBox>("cbFormat2Field4")->setCurrentIndex(0);
    QCOMPARE(example2->text(), QString("Mustermann Mustermann & Söhne"));
    // Nothing changes for the rest of the program before OK.
    QCOMPARE(CVdShared::getCompanyFormat1("Bau GmbH", "", "Statik", " "), QString("Bau GmbH (Statik)"));

    child<QPushButton>(qPrintable(button))->click();
    QCOMPARE(CVdShared::getCompanyFormat1("Bau GmbH", "", "Statik", " "),
             QString(saved ? "(Bau GmbH, Statik)" : "Bau GmbH (Statik)"));
    QCOMPARE(CVdShared::getCompanyFormat2("Bau GmbH", "Meier", "Statik", " "),
             QString(saved ? "Meier Bau GmbH" : "Meier Bau GmbH (Statik)"));
    QCOMPARE(QSettings().value("CompanyOutputFormats/format1Field2InBrackets").toBool(), saved);
    QCOMPARE(QSettings().value("CompanyOutputFormats/format2Field4", 1).toInt(), saved ? 0 : 1);

    // Reopened, the tab shows what is in force; resetting format 1 brings back its defaults.
    m_widget = openWidget(2);
    QCOMPARE(child<QCheckBox>("cbFormat1Field2InBrackets")->isChecked(), saved);
    child<QPushButton>("pbFormat1Defaults")->click();
    QVERIFY(!child<QCheckBox>("cbFormat1Field2InBrackets")->isChecked());
    QVERIFY(child<QCheckBox>("cbFormat1Field3InBrackets")->isChecked());
    QCOMPARE(child<QLineEdit>("lineEditFormat1Example")->text(), QString("Mustermann & Söhne (Architekt)"));
}

QTEST_MAIN(TestVDRProjectDataWidget)
#include "tst_vdrprojectdatawidget.moc"
