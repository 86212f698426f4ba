#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "editing/completion/CompleterEditor.h"
#include "editing/completion/CompleterModel.h"
#include "editing/completion/CompleterStringListModel.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRCompleterFactory.h"
#include "editing/completion/VDRCompleterLineEdit.h"
#include "editing/completion/VDRCompleterTextEdit.h"
#include "export/VDRCompleterExchange.h"

#include <QAbstractItemView>
#include <QApplication>
#include <QDateTime>
#include <QPushButton>
#include <QSettings>
#include <QTableView>
#include <QTemporaryDir>
#include <QTimer>
#include <QToolButton>
#include <QtTest>

#include <memory>
#include <vector>

namespace {
const QString Group = QStringLiteral("completer_%1").arg(int(QLocale::German));

std::unique_ptr<VDRCompleterLineEdit> lineEdit(const QString& title, const QString& column = QString(),
                                               int regIdx = 2)
{
    std::unique_ptr<VDRCompleterLineEdit> edit(
        VDRCompleterFactory::createEditorLine(nullptr, regIdx, title, 9, column, 4));
    edit->show();
    QApplication::setActiveWindow(edit.get());
    edit->setFocus();
    return edit;
}

// What the popup lists, or nothing while it is hidden.
QStringList popupRows(VDRCompleter* completer)
{
    QStringList rows;
    if (!completer->popup()->isVisible())
        return rows;
    for (int i = 0; i < completer->completionModel()->rowCount(); ++i)
        rows << completer->completionModel()->index(i, 0).data().toString();
    return rows;
}

// Every key and value of the language's group, to show that nothing changed.
QStringList snapshot()
{
    QSettings settings;
    settings.beginGroup(Group);
    QStringList all;
    for (const QString& key : settings.allKeys())
        all << key + QLatin1Char('=') + settings.value(key).toString();
    return all;
}

int rowOf(CompleterModel* model, const QString& field)
{
    for (int row = 0; row < model->rowCount(); ++row) {
        if (model->index(row, CompleterModel::FieldColumn).data().toString() == field)
            return row;
    }
    return -1;
}
} // namespace

class TestVDRCompleter : public VDRTestCase
{
    Q_OBJECT

    void initRun() override { QSettings().setValue(QStringLiteral("language"), int(QLocale::German)); }
    void initTest() override
    {
        QSettings settings;
        settings.remove(Group);
        settings.remove(VDRCompleter::DontShowMessageSettingsKey);
    }

private slots:
    // A stored text that names a picture on this computer shows a gap, and keeps the name.
    void storedTextReadsNoPictureFromDisk()
    {
        QImage picture(200, 100, QImage::Format_RGB32);
        picture.fill(Qt::red);
        const QString local = m_dir.filePath(QStringLiteral("geheim.png"));
        QVERIFY(picture.save(local));
        VDRCompleterTextEdit edit;
        edit.resize(400, 300);
        QVERIFY(edit.setProperty("html", QStringLiteral("<p>A</p><img src=\"%1\">").arg(local)));
        edit.show();
        QVERIFY(QTest::qWaitForWindowExposed(&edit));
        QVERIFY(edit.document()->size().height() > 0);
        const QImage shown =
            edit.document()->resource(QTextDocument::ImageResource, QUrl(local)).value<QImage>();
        QVERIFY(!shown.isNull() && shown.size() != picture.size());
        QVERIFY(edit.toHtml().contains(local));
    }

    void displayRules_data()
    {
        QTest::addColumn<QString>("entry");
        QTest::addColumn<QString>("display");
        const QString x59(59, QLatin1Char('x'));
        const auto row = [](const char* tag, const QString& entry, const QString& display) {
            QTest::newRow(tag) << entry << display;
        };
        row("line breaks", "Erste\nZweite\r\nDritte", "Erste | Zweite | Dritte");
        row("whitespace", "  Beton \t  einbringen  ", "Beton einbringen");
        row("empty line", "a\n\nb", "a | | b");
        row("59 characters", x59, x59);
        row("60 characters", x59 + "y", x59 + "y");
        row("80 characters", x59 + "y" + QString(20, 'z'), x59 + "y");
        row("long after simplifying", "a   " + x59 + "yz", "a " + x59.left(58));
    }

    void displayRules()
    {
        QFETCH(QString, entry);
        QFETCH(QString, display);
        QCOMPARE(VDRCompleter::displayText(entry), display);
        auto edit = lineEdit(QStringLiteral("Anzeige"));
        edit->ownCompleter()->appendEntry(entry);
        QCOMPARE(edit->ownCompleter()->displayList().value(0), display);
        QCOMPARE(edit->ownCompleter()->getMultiLineEntry(display), entry.trimmed());
    }

    void learns_data()
    {
        QTest::addColumn<QStringList>("typed");
        QTest::addColumn<QStringList>("entries");
        QTest::newRow("new text first") << QStringList{"Alpha", "Beta"} << QStringList{"Beta", "Alpha"};
        QTest::newRow("known text neither duplicated nor moved")
            << QStringList{"Alpha", "Beta", "Alpha"} << QStringList{"Beta", "Alpha"};
        QTest::newRow("trimmed") << QStringList{"  Alpha  ", "Alpha"} << QStringList{"Alpha"};
        QTest::newRow("blank not learned") << QStringList{"   "} << QStringList{};
        QTest::newRow("case counts") << QStringList{"alpha", "Alpha"} << QStringList{"Alpha", "alpha"};
    }

    void learns()
    {
        QFETCH(QStringList, typed);
        QFETCH(QStringList, entries);
        auto edit = lineEdit(QStringLiteral("Lernen"), QStringLiteral("Beschreibung"));
        for (const QString& text : typed) {
            edit->clear();
            QTest::keyClicks(edit.get(), text);
            QTest::keyClick(edit.get(), Qt::Key_Return);
        }
        QCOMPARE(edit->ownCompleter()->entries(), entries);
        // What the settings hold is what a new field reads.
        auto fresh = lineEdit(QStringLiteral("Lernen"), QStringLiteral("Beschreibung"));
        QCOMPARE(fresh->ownCompleter()->entries(), entries);
    }

    void sharedListOffersNewTextFirst()
    {
        auto first = lineEdit(QStringLiteral("Geteilt"), QStringLiteral("Material"));
        auto second = lineEdit(QStringLiteral("Geteilt"), QStringLiteral("Material"));
        auto other = lineEdit(QStringLiteral("Geteilt"), QStringLiteral("Einheit"));
        first->ownCompleter()->appendEntry(QStringLiteral("Ziegel alt"));
        QTest::keyClicks(first.get(), QStringLiteral("Ziegel neu"));
        QTest::keyClick(first.get(), Qt::Key_Return);

        QApplication::setActiveWindow(second.get());
        second->setFocus();
        QTest::keyClicks(second.get(), QStringLiteral("zie"));
        QCOMPARE(popupRows(second->ownCompleter()), (QStringList{"Ziegel neu", "Ziegel alt"}));
        QCOMPARE(other->ownCompleter()->size(), 0);
    }

    // Completer.xml from another installation: the open fields must not write their old lists back.
    void importReachesLiveLists()
    {
        auto edit = lineEdit(QStringLiteral("Import"));
        edit->ownCompleter()->appendEntry(QStringLiteral("alt"));
        QTemporaryDir cloud;
        QVERIFY(VDRTestFixtures::writeFile(
            VDRCompleterExchange::completerFilePath(cloud.path()),
            "<Settings><German><Import><tableID>9</tableID><simple><enabled>true</enabled><values>"
            "<value_1><centry>neu</centry></value_1><value_2><centry>neuer</centry></value_2><size>2</size>"
            "</values></simple></Import></German></Settings>"));

        QVERIFY(VDRCompleterExchange::importSettingsFromXML(cloud.path()));
        QCOMPARE(edit->ownCompleter()->entries(), (QStringList{"neu", "neuer"}));
        VDRCompleter::writeAll();
        QCOMPARE(lineEdit(QStringLiteral("Import"))->ownCompleter()->entries(),
                 (QStringList{"neu", "neuer"}));
    }

    void offers_data()
    {
        QTest::addColumn<QString>("typed");
        QTest::addColumn<bool>("ctrlE");
        QTest::addColumn<bool>("enabled");
        QTest::addColumn<QStringList>("shown");
        QTest::newRow("prefix, any case, newest first")
            << "be" << false << true << QStringList{"Bewehrung", "Beton"};
        QTest::newRow("no match") << "x" << false << true << QStringList{};
        QTest::newRow("only match equals text") << "Kies" << false << true << QStringList{};
        QTest::newRow("ends in a stop character") << "Be." << false << true << QStringList{};
        QTest::newRow("list switched off") << "Be" << false << false << QStringList{};
        QTest::newRow("Ctrl+E on an empty field")
            << "" << true << true << QStringList{"Kies", "Bewehrung", "Beton"};
        QTest::newRow("Ctrl+E on an exact text") << "Kies" << true << true << QStringList{"Kies"};
    }

    void offers()
    {
        QFETCH(QString, typed);
        QFETCH(bool, ctrlE);
        QFETCH(bool, enabled);
        QFETCH(QStringList, shown);
        auto edit = lineEdit(QStringLiteral("Angebot"));
        VDRCompleter* completer = edit->ownCompleter();
        for (const char* entry : {"Beton", "Bewehrung", "Kies"})
            completer->appendEntry(QString::fromLatin1(entry));
        completer->setActive(enabled);
        QTest::keyClicks(edit.get(), typed);
        if (ctrlE)
            QTest::keyClick(edit.get(), Qt::Key_E, Qt::ControlModifier);
        QCOMPARE(popupRows(completer), shown);
        QCOMPARE(edit->text(), typed); // Ctrl+E types nothing
    }

    void choosingInsertsFullEntry_data()
    {
        QTest::addColumn<bool>("multiLine");
        QTest::addColumn<QString>("before");
        QTest::addColumn<QString>("typed");
        QTest::addColumn<QString>("entry");
        QTest::addColumn<QString>("result");
        const QString long80 = QStringLiteral("Betonprobekörper entnommen, ") + QString(52, QLatin1Char('x'));
        const auto row = [](const char* tag, bool multiLine, const QString& before, const QString& typed,
                            const QString& entry, const QString& result) {
            QTest::newRow(tag) << multiLine << before << typed << entry << result;
        };
        row("one line, 80 characters", false, "", "beton", long80, long80);
        row("one line, multi-line entry", false, "", "Zwei", "Zwei\nZeilen", "Zwei\nZeilen");
        row("text, 80 characters", true, "", "beton", long80, long80);
        row("text, second paragraph", true, "Erste Zeile\n", "Lief",
            "Lieferung\nLieferschein-Nr.:", "Erste Zeile\nLieferung\nLieferschein-Nr.:");
    }

    void choosingInsertsFullEntry()
    {
        QFETCH(bool, multiLine);
        QFETCH(QString, before);
        QFETCH(QString, typed);
        QFETCH(QString, entry);
        QFETCH(QString, result);
        QCOMPARE(entry.size() == 80, result.size() == 80);
        std::unique_ptr<QWidget> field;
        VDRCompleter* completer;
        if (multiLine) {
            auto* text = VDRCompleterFactory::createSpellCheckEditorText(
                nullptr, 3, QStringLiteral("Wahl"), 9, QStringLiteral("Beschreibung"), 4, nullptr);
            field.reset(text);
            text->setPlainText(before);
            text->moveCursor(QTextCursor::End);
            completer = text->completer();
        } else {
            auto* line =
                VDRCompleterFactory::createEditorLine(nullptr, 3, QStringLiteral("Wahl"), 9, QString(), 4);
            field.reset(line);
            completer = line->ownCompleter();
        }
        field->show();
        QApplication::setActiveWindow(field.get());
        field->setFocus();
        completer->appendEntry(entry);
        QTest::keyClicks(field.get(), typed);
        QCOMPARE(popupRows(completer), QStringList{VDRCompleter::displayText(entry)});
        QTest::keyClick(completer->popup(), Qt::Key_Down);
        QTest::keyClick(completer->popup(), Qt::Key_Return);
        QVERIFY(!completer->popup()->isVisible());
        if (multiLine)
            QCOMPARE(static_cast<VDRCompleterTextEdit*>(field.get())->toPlainText(), result);
        else
            QCOMPARE(static_cast<VDRCompleterLineEdit*>(field.get())->text(), result);
    }

    void storageLayout_data()
    {
        QTest::addColumn<QString>("column");
        QTest::addColumn<QString>("stored");
        QTest::newRow("column list") << QStringLiteral("Beschreibung") << QStringLiteral("Beschreibung");
        QTest::newRow("whole-field list") << QString() << QStringLiteral("simple");
    }

    void storageLayout()
    {
        QFETCH(QString, column);
        QFETCH(QString, stored);
        auto edit = lineEdit(QStringLiteral("Prüf Stelle"), column, 2);
        QTest::keyClicks(edit.get(), QStringLiteral("Erster"));
        QTest::keyClick(edit.get(), Qt::Key_Return);
        edit->clear();
        QTest::keyClicks(edit.get(), QStringLiteral("Zweiter"));
        QTest::keyClick(edit.get(), Qt::Key_Return);

        QSettings settings;
        const QString list = Group + QStringLiteral("/Prüf Stelle/") + stored;
        QCOMPARE(settings.value(Group + QStringLiteral("/Prüf Stelle/tableID")).toInt(), 9);
        QCOMPARE(settings.value(list + "/enabled").toBool(), true);
        QCOMPARE(settings.value(list + "/regIdx").toInt(), 2);
        QCOMPARE(settings.value(list + "/columnID").toInt(), 4);
        QCOMPARE(settings.value(list + "/values/size").toInt(), 2);
        QCOMPARE(settings.value(list + "/values/1/centry").toString(), QStringLiteral("Zweiter"));
        QCOMPARE(settings.value(list + "/values/2/centry").toString(), QStringLiteral("Erster"));
        QCOMPARE(settings.value(Group + "/init").toBool(), true);
        // A shorter list leaves no old items behind.
        edit->ownCompleter()->removeEntry(0);
        QCOMPARE(settings.value(list + "/values/size").toInt(), 1);
        QVERIFY(!settings.contains(list + "/values/2/centry"));
    }

    void defaultsWrittenOnce()
    {
        struct Default
        {
            const char* list;
            int regIdx;
            QStringList entries;
        };
        const Default defaults[] = {
            {"Witterung Bewölkung/simple", 0, {"wolkenlos", "heiter", "wolkig", "stark bewölkt", "bedeckt"}},
            {"Witterung Wind/simple", 0, {"windstill", "windig", "böig", "stürmisch"}},
            {"Baustoffe/Einheit", 5, {"m", "m²", "m³", "kg", "t"}},
            {"Baumaßnahmen/Beschreibung",
             3,
             {"Beispiel \"Beton\":", "Beton einbringen, Betontemp., LuftTemp., Witterung...",
              "Ausschal-Arbeiten...", "Nachbehandlung, Methode, Dauer...",
              "Betonprobekörper..., Bezeichnung..., Bauteil..., Prüfergebnis...",
              "Frischbetonuntersuchung..., ", "Tragwerk-Eingriffe"}},
            {"Zeiterfassung/Personen",
             1,
             {"Personen", "Bauleiter", "Polier/e", "Vorarbeiter", "Facharbeiter", "Helfer"}},
            {"Mängel/Raumbuch-Nr.", 2, {"UG-001", "EG-001", "OG-001", "DG-001"}}};
        VDRCompleter::migrateSettings(); // the start-up call on a fresh store
        QSettings settings;
        QCOMPARE(settings.value(Group + "/init").toBool(), true);
        std::vector<std::unique_ptr<VDRCompleter>> completers;
        for (const Default& d : defaults) {
            const QString list = QString::fromUtf8(d.list);
            const QString column = list.section('/', 1, 1);
            QCOMPARE(settings.value(Group + '/' + list + "/regIdx").toInt(), d.regIdx);
            completers.push_back(std::make_unique<VDRCompleter>(
                d.regIdx, list.section('/', 0, 0), 9, column == "simple" ? QString() : column, 4, nullptr));
            QCOMPARE(completers.back()->entries(), d.entries);
        }

        const QStringList written = snapshot();
        CompleterEditor::resetToDefaults(true);
        CompleterEditor::writeNewDocumentDefaults();
        QCOMPARE(snapshot(), written);

        // A changed list survives later start-ups and new diaries.
        VDRCompleter& units = *completers[2];
        units.appendEntry(QStringLiteral("Eigener Text"));
        CompleterEditor::resetToDefaults(true);
        CompleterEditor::writeNewDocumentDefaults();
        units.updateStatus();
        QCOMPARE(units.entries(), QStringList{"Eigener Text"} + defaults[2].entries);
        // A new diary restores its own lists when they are missing, and only those.
        settings.remove(Group + QStringLiteral("/Mängel"));
        settings.remove(Group + QStringLiteral("/Witterung Wind"));
        CompleterEditor::writeNewDocumentDefaults();
        QCOMPARE(settings.value(Group + QStringLiteral("/Mängel/Raumname/values/1/centry")).toString(),
                 QStringLiteral("Büro"));
        QVERIFY(!settings.contains(Group + QStringLiteral("/Witterung Wind/simple/values/size")));
    }

    void editorRows_data()
    {
        QTest::addColumn<int>("regIdx");
        QTest::addColumn<QString>("title");
        QTest::addColumn<QString>("column");
        QTest::addColumn<QString>("field");
        const auto row = [](const char* tag, int regIdx, const char* title, const char* column,
                            const char* field) {
            QTest::newRow(tag) << regIdx << QString::fromUtf8(title) << QString::fromUtf8(column)
                               << QString::fromUtf8(field);
        };
        row("whole-field list", 4, "Notizen", "", "Vermerke - Notizen");
        row("column list", 2, "Prüfstelle", "Beschreibung", "Störungen - Prüfstelle - Beschreibung");
        row("default list", 0, "Witterung Wind", "", "Bautenstand - Witterung Wind");
        row("default column list", 5, "Baustoffe", "Einheit", "Baustoffe - Baustoffe - Einheit");
        row("unknown register", 12, "Fremd", "", " - Fremd");
    }

    void editorRows()
    {
        QFETCH(int, regIdx);
        QFETCH(QString, title);
        QFETCH(QString, column);
        QFETCH(QString, field);
        auto edit = lineEdit(title, column, regIdx);
        edit->ownCompleter()->appendEntry(QStringLiteral("Gelernt"));
        CompleterEditor editor;
        const int row = rowOf(editor.completerModel(), field);
        QVERIFY2(row >= 0, qPrintable(field));
        QCOMPARE(editor.completerModel()
                     ->index(row, CompleterModel::ActiveColumn)
                     .data(Qt::CheckStateRole)
                     .toInt(),
                 int(Qt::Checked));
        QCOMPARE(editor.completerModel()->info(row).strings().value(0), QStringLiteral("Gelernt"));
    }

    void editorOkWritesChangedLists()
    {
        auto edit = lineEdit(QStringLiteral("Prüfstelle"), QStringLiteral("Beschreibung"));
        edit->ownCompleter()->appendEntry(QStringLiteral("Alt"));
        CompleterEditor::resetToDefaults(true);
        const QString windBefore = QSettings().value(Group + "/Witterung Wind/simple/updateTime").toString();

        CompleterEditor editor;
        editor.show();
        CompleterModel* model = editor.completerModel();
        const int row = rowOf(model, QStringLiteral("Störungen - Prüfstelle - Beschreibung"));
        QVERIFY(row >= 0);
        model->setData(model->index(row, CompleterModel::ActiveColumn), Qt::Unchecked, Qt::CheckStateRole);
        editor.findChild<QTableView*>()->setCurrentIndex(model->index(row, 0));
        QCOMPARE(editor.stringModel()->stringList(), QStringList{"Alt"});
        editor.findChild<QPushButton*>(QStringLiteral("pushButtonAdd"))->click();
        editor.stringModel()->setData(editor.stringModel()->index(0), QStringLiteral("Neu\nzweizeilig"));
        editor.findChild<QPushButton*>(QStringLiteral("pushButtonOk"))->click();
        QCOMPARE(editor.result(), int(QDialog::Accepted));

        QSettings settings;
        const QString list = Group + QStringLiteral("/Prüfstelle/Beschreibung");
        QCOMPARE(settings.value(list + "/enabled").toBool(), false);
        QCOMPARE(settings.value(list + "/values/size").toInt(), 2);
        QCOMPARE(settings.value(list + "/values/1/centry").toString(), QStringLiteral("Neu\nzweizeilig"));
        QVERIFY(
            QDateTime::fromString(settings.value(list + "/updateTime").toString(), Qt::TextDate).isValid());
        QCOMPARE(settings.value(Group + "/Witterung Wind/simple/updateTime").toString(),
                 windBefore); // unchanged list

        VDRCompleter::updateAll();
        QVERIFY(!edit->ownCompleter()->isActive());
        QCOMPARE(edit->ownCompleter()->displayList().value(0), QStringLiteral("Neu | zweizeilig"));
    }

    void editorCancelAsksAndKeepsSettings()
    {
        CompleterEditor::resetToDefaults(false);
        const QStringList before = snapshot();
        CompleterEditor editor;
        editor.show();
        editor.findChild<QPushButton*>(QStringLiteral("pushButtonNone"))->click();
        m_prompt.expect(QStringLiteral("Autovervollständigen bearbeiten"), QString(), VDRPrompt::No);
        editor.findChild<QPushButton*>(QStringLiteral("pushButtonCancel"))->click();
        QVERIFY(editor.isVisible());
        m_prompt.expect(QStringLiteral("Autovervollständigen bearbeiten"), QString(), VDRPrompt::Yes);
        editor.findChild<QPushButton*>(QStringLiteral("pushButtonCancel"))->click();
        QVERIFY(!editor.isVisible());
        QCOMPARE(snapshot(), before);
    }

    void resetRestoresDefaults()
    {
        CompleterEditor::resetToDefaults(true);
        const QStringList defaults = snapshot();
        auto wind = lineEdit(QStringLiteral("Witterung Wind"), QString(), 0);
        auto own = lineEdit(QStringLiteral("Eigene Liste"));
        wind->ownCompleter()->appendEntry(QStringLiteral("orkanartig"));
        wind->ownCompleter()->setActive(false);
        own->ownCompleter()->appendEntry(QStringLiteral("Eigenes"));

        CompleterEditor editor;
        editor.show();
        QVERIFY(rowOf(editor.completerModel(), QStringLiteral("Störungen - Eigene Liste")) >= 0);
        editor.findChild<QPushButton*>(QStringLiteral("pushButtonReset"))->click();
        QCOMPARE(snapshot(), defaults);
        QCOMPARE(rowOf(editor.completerModel(), QStringLiteral("Störungen - Eigene Liste")), -1);
        QCOMPARE(wind->ownCompleter()->entries(), (QStringList{"windstill", "windig", "böig", "stürmisch"}));
        QVERIFY(wind->ownCompleter()->isActive());
        QCOMPARE(own->ownCompleter()->size(), 0);
        editor.findChild<QPushButton*>(QStringLiteral("pushButtonCancel"))->click(); // nothing left to ask
        QVERIFY(!editor.isVisible());
    }

    void autotexteBox_data()
    {
        QTest::addColumn<int>("answer");
        QTest::addColumn<bool>("tick");
        QTest::addColumn<bool>("shownAgain");
        QTest::addColumn<bool>("editorOpened");
        QTest::newRow("Schließen") << 1 << false << true << false;
        QTest::newRow("not again") << 1 << true << false << false;
        QTest::newRow("Autotexte bearbeiten") << 0 << false << true << true;
    }

    void autotexteBox()
    {
        QFETCH(int, answer);
        QFETCH(bool, tick);
        QFETCH(bool, shownAgain);
        QFETCH(bool, editorOpened);
        auto edit = lineEdit(QStringLiteral("Leer"));
        const QString title = QStringLiteral("Autotexte");
        const QString text =
            QStringLiteral("Für dieses Feld stehen noch keine gespeicherten Eingaben zur Verfügung.");
        if (tick)
            m_prompt.expectTicked(title, text, answer);
        else
            m_prompt.expect(title, text, answer);
        QString openedTitle;
        if (editorOpened) {
            QTimer::singleShot(0, [&openedTitle] {
                if (auto* editor = qobject_cast<CompleterEditor*>(QApplication::activeModalWidget())) {
                    openedTitle = editor->windowTitle();
                    editor->reject();
                }
            });
        }
        edit->listButton()->click();
        QCOMPARE(m_prompt.messages.value(0).buttons, (QStringList{"Autotexte bearbeiten", "Schließen"}));
        QCOMPARE(openedTitle, editorOpened ? QStringLiteral("Autovervollständigen bearbeiten") : QString());
        QCOMPARE(QSettings().value(VDRCompleter::DontShowMessageSettingsKey, false).toBool(), tick);

        if (shownAgain)
            m_prompt.expect(title, text, 1);
        edit->listButton()->click(); // without the box: the prompt fails on any message
        QCOMPARE(m_prompt.messages.size(), shownAgain ? 2 : 1);

        // With entries the button lists them all instead.
        edit->ownCompleter()->appendEntry(QStringLiteral("Eins"));
        edit->ownCompleter()->appendEntry(QStringLiteral("Zwei"));
        edit->listButton()->click();
        QCOMPARE(popupRows(edit->ownCompleter()), (QStringList{"Zwei", "Eins"}));
    }
};

QTEST_MAIN(TestVDRCompleter)
#include "tst_vdrcompleter.moc"
