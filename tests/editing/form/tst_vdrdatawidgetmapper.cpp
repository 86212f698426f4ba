#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "editing/form/VDRDataWidgetMapper.h"

#include <QCheckBox>
#include <QLineEdit>
#include <QSpinBox>
#include <QSqlError>
#include <QSqlQuery>
#include <QTextDocument>
#include <QTextEdit>
#include <QVBoxLayout>
#include <QtTest>

#include <functional>
#include <memory>

// A form as the report form builds it: line edit, spin box, check box and a rich-text editor in a frame.
struct Form
{
    Form(VDRSqlTableModel* model, const QStringList& fields)
    {
        auto* layout = new QVBoxLayout(&window);
        line = new QLineEdit;
        spin = new QSpinBox;
        spin->setRange(0, 9999);
        check = new QCheckBox;
        richBox = new QWidget;
        rich = new QTextEdit(richBox);
        for (QWidget* w : std::initializer_list<QWidget*>{line, spin, check, richBox})
            layout->addWidget(w);
        mapper.setModel(model);
        mapper.addMapping(line, fields.value(0), "text");
        mapper.addMapping(spin, fields.value(1), "value");
        mapper.addMapping(richBox, fields.value(2), "richtext");
        if (fields.size() > 3)
            mapper.addMapping(check, fields.value(3), "checked");
    }
    QWidget window;
    QLineEdit* line;
    QSpinBox* spin;
    QCheckBox* check;
    QWidget* richBox;
    QTextEdit* rich;
    VDRDataWidgetMapper mapper;
};

static QString plain(const QVariant& html)
{
    QTextDocument doc;
    doc.setHtml(html.toString());
    return doc.toPlainText();
}

class TestVDRDataWidgetMapper : public VDRTestCase
{
    Q_OBJECT

    void initTest() override
    {
        m_doc = std::make_unique<VDRDocument>();
        QVERIFY(m_doc->createDocument(true));
        exec(QStringLiteral("UPDATE company SET company = 'Firma ' || id"));
        QVERIFY(m_doc->modelCompany1()->select());
    }

    void cleanupTest() override
    {
        if (m_doc)
            m_doc->closeDocument();
        m_doc.reset();
    }

private slots:
    void navigation_data()
    {
        QTest::addColumn<QStringList>("steps");
        QTest::addColumn<int>("row");
        QTest::newRow("first") << QStringList{"toFirst"} << 0;
        QTest::newRow("last") << QStringList{"toLast"} << 2;
        QTest::newRow("next") << QStringList{"toFirst", "toNext"} << 1;
        QTest::newRow("previous") << QStringList{"toLast", "toPrevious"} << 1;
        QTest::newRow("next stops at the end") << QStringList{"toLast", "toNext"} << 2;
        QTest::newRow("previous stops at the start") << QStringList{"toFirst", "toPrevious"} << 0;
    }

    void navigation()
    {
        QFETCH(QStringList, steps);
        QFETCH(int, row);
        auto form = companyForm();
        VDRDataWidgetMapper& mapper = form->mapper;
        const QHash<QString, std::function<void()>> moves = {{"toFirst", [&] { mapper.toFirst(); }},
                                                             {"toLast", [&] { mapper.toLast(); }},
                                                             {"toNext", [&] { mapper.toNext(); }},
                                                             {"toPrevious", [&] { mapper.toPrevious(); }}};
        for (const QString& step : steps)
            moves.value(step)();
        VDRSqlTableModel* model = m_doc->modelCompany1();
        QCOMPARE(form->mapper.currentRow(), row);
        QCOMPARE(form->line->text(), model->data(row, QStringLiteral("type")).toString());
        QCOMPARE(form->spin->value(), model->data(row, QStringLiteral("pos")).toInt());
        QCOMPARE(form->rich->toPlainText(), model->data(row, QStringLiteral("company")).toString());
    }

    void noRowShowsEmpty_data()
    {
        QTest::addColumn<QString>("filter");
        QTest::addColumn<int>("row");
        QTest::newRow("past the end") << QString() << 3;
        QTest::newRow("no current row") << QString() << -1;
        QTest::newRow("empty model") << QStringLiteral("category = 99") << 0;
    }

    void noRowShowsEmpty()
    {
        QFETCH(QString, filter);
        QFETCH(int, row);
        auto form = companyForm();
        form->mapper.toFirst();
        QVERIFY(!form->line->text().isEmpty());
        if (!filter.isEmpty()) {
            m_doc->modelCompany1()->setFilter(filter);
            QCOMPARE(m_doc->modelCompany1()->rowCount(), 0);
        }
        form->mapper.setCurrentRow(row);
        QCOMPARE(form->mapper.currentRow(), -1);
        QCOMPARE(form->line->text(), QString());
        QCOMPARE(form->spin->value(), 0);
        QCOMPARE(form->rich->toPlainText(), QString());
        // Without a row nothing can be written.
        form->line->setText(QStringLiteral("verloren"));
        form->mapper.submit();
        QVERIFY(!m_doc->modelCompany1()->isDirty());
    }

    void commitWritesOnlyChanges_data()
    {
        QTest::addColumn<QString>("widget");
        QTest::addColumn<QVariant>("input");
        QTest::addColumn<QString>("stored");
        // An invalid input leaves the widget as populated; 'stored' is empty when nothing may be written.
        QTest::newRow("text untouched, NULL in the file") << "line" << QVariant() << QString();
        QTest::newRow("text changed") << "line" << QVariant("Prüfung Beton") << "Prüfung Beton";
        QTest::newRow("number untouched") << "spin" << QVariant() << QString();
        QTest::newRow("number changed") << "spin" << QVariant(2) << "2";
        QTest::newRow("check box untouched") << "check" << QVariant() << QString();
        QTest::newRow("check box cleared") << "check" << QVariant(false) << "0";
        QTest::newRow("rich text untouched") << "rich" << QVariant() << QString();
        // Formatting is the user's work too: made bold, the same text is written.
        QTest::newRow("rich text, made bold")
            << "rich" << QVariant("<p><b>Rohbau fertig</b></p>") << "Rohbau fertig";
        QTest::newRow("rich text changed")
            << "rich" << QVariant("<p>Rohbau abgenommen</p>") << "Rohbau abgenommen";
    }

    void commitWritesOnlyChanges()
    {
        QFETCH(QString, widget);
        QFETCH(QVariant, input);
        QFETCH(QString, stored);
        exec(QStringLiteral("UPDATE entry SET tests = NULL, progress = 'Rohbau fertig'"));
        VDRSqlTableModel* model = m_doc->modelEntryAll();
        QVERIFY(model->select());
        const QStringList fields{"tests", "construction_material_sample", "progress", "print_notice"};
        Form form(model, fields);
        form.mapper.toFirst();
        QCOMPARE(form.rich->toPlainText(), QStringLiteral("Rohbau fertig"));
        QVERIFY(form.check->isChecked());

        if (widget == QLatin1String("line") && input.isValid())
            form.line->setText(input.toString());
        if (widget == QLatin1String("spin") && input.isValid())
            form.spin->setValue(input.toInt());
        if (widget == QLatin1String("check") && input.isValid())
            form.check->setChecked(input.toBool());
        if (widget == QLatin1String("rich")) {
            if (input.isValid())
                form.rich->setHtml(input.toString());
            QTextCursor cursor = form.rich->textCursor();
            cursor.setPosition(4);
            form.rich->setTextCursor(cursor);
        }

        QSignalSpy writes(model, &QAbstractItemModel::dataChanged);
        QVERIFY(form.mapper.submit());
        QCOMPARE(writes.count(), stored.isEmpty() ? 0 : 1);
        QCOMPARE(model->isDirty(), !stored.isEmpty());
        const QString field = fields.value(QStringList({"line", "spin", "rich", "check"}).indexOf(widget));
        // Writing back must not reload the editor under the user's cursor.
        if (widget == QLatin1String("rich"))
            QCOMPARE(form.rich->textCursor().position(), 4);
        if (stored.isEmpty())
            return;
        QVERIFY(model->submitAll());
        QSqlQuery q(m_doc->database());
        QVERIFY(q.exec(QStringLiteral("SELECT %1 FROM entry").arg(field)) && q.next());
        QCOMPARE(plain(q.value(0)), stored);
    }

    void focusOut_data()
    {
        QTest::addColumn<bool>("autoSubmit");
        QTest::addColumn<bool>("rich");
        QTest::newRow("line edit, auto") << true << false;
        QTest::newRow("line edit, manual") << false << false;
        QTest::newRow("rich text, auto") << true << true;
        QTest::newRow("rich text, manual") << false << true;
    }

    void focusOut()
    {
        QFETCH(bool, autoSubmit);
        QFETCH(bool, rich);
        auto form = companyForm();
        form->mapper.setSubmitPolicy(autoSubmit ? VDRDataWidgetMapper::AutoSubmit
                                                : VDRDataWidgetMapper::ManualSubmit);
        form->mapper.toFirst();
        form->window.show();
        QApplication::setActiveWindow(&form->window);
        QVERIFY(QTest::qWaitForWindowActive(&form->window));

        // The focus sits in the editor itself; for rich text that is the editor inside the frame.
        QWidget* editor = rich ? static_cast<QWidget*>(form->rich) : form->line;
        editor->setFocus();
        QTRY_VERIFY(editor->hasFocus());
        if (rich)
            form->rich->setPlainText(QStringLiteral("Firma Neu"));
        else
            form->line->setText(QStringLiteral("Firma Neu"));
        const QString field = rich ? QStringLiteral("company") : QStringLiteral("type");
        const QString before = m_doc->modelCompany1()->data(0, field).toString();

        form->spin->setFocus();
        QTRY_VERIFY(form->spin->hasFocus());
        VDRSqlTableModel* model = m_doc->modelCompany1();
        QCOMPARE(plain(model->data(0, field)), autoSubmit ? QStringLiteral("Firma Neu") : before);

        if (!autoSubmit) {
            form->mapper.revert();
            QCOMPARE(rich ? form->rich->toPlainText() : form->line->text(), before);
        }
    }

    void modelChangesReachWidgets_data()
    {
        QTest::addColumn<int>("row");
        QTest::addColumn<bool>("shown");
        QTest::newRow("current row") << 1 << true;
        QTest::newRow("other row") << 2 << false;
    }

    void modelChangesReachWidgets()
    {
        QFETCH(int, row);
        QFETCH(bool, shown);
        auto form = companyForm();
        form->mapper.setCurrentRow(1);
        const QString typeBefore = form->line->text();
        const QString companyBefore = form->rich->toPlainText();

        VDRSqlTableModel* model = m_doc->modelCompany1();
        QVERIFY(model->setData(row, QStringLiteral("type"), QStringLiteral("Statiker")));
        QVERIFY(model->setData(row, QStringLiteral("company"), QStringLiteral("Ingenieurbüro")));
        QCOMPARE(form->line->text(), shown ? QStringLiteral("Statiker") : typeBefore);
        QCOMPARE(form->rich->toPlainText(), shown ? QStringLiteral("Ingenieurbüro") : companyBefore);
    }

    // The report form rebuilds parts of itself; a mapping must not outlive its widget.
    void deletedWidgetIsLeftOut()
    {
        auto form = companyForm();
        form->mapper.toFirst();
        delete form->line;
        form->line = nullptr;
        form->mapper.toNext();
        QCOMPARE(form->spin->value(), m_doc->modelCompany1()->data(1, QStringLiteral("pos")).toInt());
        form->spin->setValue(42);
        QVERIFY(form->mapper.submit());
        QCOMPARE(m_doc->modelCompany1()->data(1, QStringLiteral("pos")).toInt(), 42);
        // A change of the dead widget's column reaches the mapper too.
        QVERIFY(m_doc->modelCompany1()->setData(1, QStringLiteral("type"), QStringLiteral("Statiker")));
    }

    void nullDoesNotCarryOverFromPreviousRow()
    {
        // A number field on a column that is NULL in the next row must not keep, and later write, the
        // previous row's value.
        exec(QStringLiteral("UPDATE entry SET progress_audio_id = 7"));
        exec(QStringLiteral(
            "INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, "
            "inspection_time_to, env_time, env_weather1, env_weather2, env_weather3, env_temperature, "
            "env_humidity, progress, deficiencies, construction_material_sample, print_notice, "
            "print_telephone_notice, progress_audio_id) VALUES (2, 0, '002 (Entwurf)', '2026-12-02', "
            "'08:00', '09:00', '08:00', '', '', '', '', '', '', '', 0, 1, 1, NULL)"));
        VDRSqlTableModel* model = m_doc->modelEntryAll();
        QVERIFY(model->select());
        QWidget window;
        auto* spin = new QSpinBox(&window);
        VDRDataWidgetMapper mapper;
        mapper.setModel(model);
        mapper.addMapping(spin, QStringLiteral("progress_audio_id"), "value");
        mapper.setCurrentRow(model->rowById(1));
        QCOMPARE(spin->value(), 7);
        mapper.setCurrentRow(model->rowById(2));
        QCOMPARE(spin->value(), 0);
        QVERIFY(mapper.submit());
        QVERIFY(!model->isDirty());
        QVERIFY(model->dataById(2, QStringLiteral("progress_audio_id"), Qt::EditRole).isNull());
    }

private:
    void exec(const QString& sql) { QVERIFY(VDRTestFixtures::execOn(m_doc->database(), {sql})); }

    std::unique_ptr<Form> companyForm()
    {
        return std::make_unique<Form>(m_doc->modelCompany1(), QStringList{"type", "pos", "company"});
    }

    std::unique_ptr<VDRDocument> m_doc;
};

QTEST_MAIN(TestVDRDataWidgetMapper)
#include "tst_vdrdatawidgetmapper.moc"
