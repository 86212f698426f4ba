#include "VDRTestCase.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "editing/reportlist/QSpinBoxLetter.h"
#include "editing/reportlist/VDREntryInsertDialog.h"
#include "editing/reportlist/VDREntryNumberDialog.h"

#include <QLabel>
#include <QLineEdit>
#include <QSpinBox>
#include <QtTest>

#include <memory>

class TestVDREntryDialogs : public VDRTestCase
{
    Q_OBJECT

private slots:
    // What the user types into the letter box, keystroke by keystroke, and the index it gives.
    void letterBox_data()
    {
        QTest::addColumn<QString>("typed");
        QTest::addColumn<QString>("shown");
        QTest::addColumn<char>("letter");
        QTest::newRow("nothing") << ""
                                 << "" << char(0);
        QTest::newRow("a") << "a"
                           << "a" << 'a';
        QTest::newRow("z") << "z"
                           << "z" << 'z';
        QTest::newRow("upper case") << "C"
                                    << "c" << 'c';
        // Further letters and digits are refused as typed: the first letter stays.
        QTest::newRow("several letters") << "bcd"
                                         << "b" << 'b';
        QTest::newRow("digit") << "7"
                               << "" << char(0);
        QTest::newRow("sign") << "-"
                              << "" << char(0);
    }

    void letterBox()
    {
        QFETCH(QString, typed);
        QFETCH(QString, shown);
        QFETCH(char, letter);
        VDREntryNumberDialog dialog(nullptr, nullptr);
        auto* box = dialog.findChild<QSpinBoxLetter*>(QStringLiteral("spinBoxLetter"));
        QVERIFY(box);
        QLineEdit* edit = box->findChild<QLineEdit*>();
        edit->selectAll();
        QTest::keyClick(edit, Qt::Key_Delete);
        QTest::keyClicks(edit, typed);
        box->interpretText();
        QCOMPARE(edit->text(), shown);
        QCOMPARE(dialog.getEntryLetter(), letter);
        // The arrows step through the letters and back to none.
        box->setValue(26);
        QCOMPARE(box->text(), QStringLiteral("z"));
        box->stepDown();
        QCOMPARE(dialog.getEntryLetter(), 'y');
        box->setValue(0);
        QCOMPARE(box->text(), QString());
    }

    // The number has the diary's digit count; the spin box stops at its largest number.
    void numberDigits_data()
    {
        QTest::addColumn<QString>("firstNumber"); // empty: no document
        QTest::addColumn<bool>("insert");
        QTest::addColumn<int>("maximum");
        QTest::addColumn<QString>("preset");
        QTest::addColumn<char>("presetLetter");
        QTest::addColumn<QString>("expected");
        QTest::newRow("no document") << "" << false << 999 << "7" << 'b' << "007b";
        QTest::newRow("three digits") << "001 (Entwurf)" << true << 999 << "012a (Entwurf)" << 'a' << "012a";
        QTest::newRow("four digits") << "0001" << false << 9999 << "0042" << char(0) << "0042";
        // Built with only a parent: the diary of the window around it counts.
        QTest::newRow("window's diary") << "0001 (Entwurf)" << true << 9999 << "42" << 'c' << "0042c";
        QTest::newRow("five digits") << "00001 (Entwurf)" << true << 99999 << "10000" << 'Z' << "10000z";
        QTest::newRow("too large") << "0001" << false << 9999 << "123456" << char(0) << "9999";
        QTest::newRow("no digits") << "001" << false << 999 << "abc" << '#' << "001";
    }

    void numberDigits()
    {
        QFETCH(QString, firstNumber);
        QFETCH(bool, insert);
        QFETCH(int, maximum);
        QFETCH(QString, preset);
        QFETCH(char, presetLetter);
        QFETCH(QString, expected);
        std::unique_ptr<VDRDocument> doc;
        if (!firstNumber.isEmpty()) {
            doc = std::make_unique<VDRDocument>();
            QVERIFY(doc->createDocument(true));
            QVERIFY(doc->modelEntryAll()->setData(0, QStringLiteral("number"), firstNumber));
        }
        QWidget window;
        auto* form = new QWidget(&window);
        std::unique_ptr<VDREntryNumberDialog> dialog;
        if (QTest::currentDataTag() == QByteArray("window's diary")) {
            doc->setParent(&window);
            dialog.reset(new VDREntryInsertDialog(form));
        } else {
            dialog.reset(insert ? new VDREntryInsertDialog(doc.get()) : new VDREntryNumberDialog(doc.get()));
        }
        QCOMPARE(dialog->windowTitle(), QStringLiteral("Nummer vergeben"));
        QCOMPARE(dialog->findChild<QLabel*>(QStringLiteral("labelText"))->text(),
                 insert ? QStringLiteral("Geben Sie die neue Bauberichtsnummer ein")
                        : QStringLiteral("Vergeben Sie hier eine neue Bauberichtsnummer, sofern gewünscht."));
        auto* number = dialog->findChild<QSpinBox*>(QStringLiteral("spinBoxNumber"));
        QCOMPARE(number->minimum(), 1);
        QCOMPARE(number->maximum(), maximum);
        dialog->setEntryNumber(preset);
        dialog->setEntryLetter(presetLetter);
        const char letter = dialog->getEntryLetter();
        QCOMPARE(dialog->getEntryNumber() + (letter ? QString(QChar(letter)) : QString()), expected);
        dialog.reset();
        if (doc && doc->parent())
            doc.release(); // the window owns it now
    }
};

QTEST_MAIN(TestVDREntryDialogs)
#include "tst_vdrentrydialogs.moc"
