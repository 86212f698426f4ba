#include "VDRTestCase.h"
#include "document/VDREntryNumber.h"

#include <QtTest>

#include <climits>

class TestVDREntryNumber : public VDRTestCase
{
    Q_OBJECT

private slots:
    void parts_data()
    {
        QTest::addColumn<QString>("text");
        QTest::addColumn<QString>("userId");
        QTest::addColumn<int>("digits");
        QTest::addColumn<int>("number");
        QTest::addColumn<QString>("letter");
        QTest::addColumn<bool>("draft");
        QTest::addColumn<QString>("withoutDraft");
        QTest::addColumn<QString>("withUserId");
        // The number alone as a new draft, padded to three digits or more.
        QTest::addColumn<QString>("newDraft");
        const QString arabicIndic = QStringLiteral("\u0660\u0661\u0662b");
        // clang-format off
        QTest::newRow("locked") << "012" << "" << 3 << 12 << "" << false << "012" << "012" << "012 (Entwurf)";
        QTest::newRow("inserted draft, author") << "012a (Entwurf)" << "AB" << 3 << 12 << "a" << true << "012a"
                                                << "012a-AB (Entwurf)" << "012 (Entwurf)";
        QTest::newRow("four digits") << "0999 (Entwurf)" << "" << 4 << 999 << "" << true << "0999"
                                     << "0999 (Entwurf)" << "0999 (Entwurf)";
        QTest::newRow("five digits, author") << "12345" << "XY" << 5 << 12345 << "" << false << "12345"
                                             << "12345-XY" << "12345 (Entwurf)";
        QTest::newRow("no digits") << "Nr. 5 (Entwurf)" << "AB" << -1 << 0 << "" << true << "Nr. 5"
                                   << "Nr. 5-AB (Entwurf)" << "000 (Entwurf)";
        QTest::newRow("non-Latin digits") << arabicIndic + " (Entwurf)" << "" << 3 << 12 << "b" << true
                                          << arabicIndic << arabicIndic + " (Entwurf)" << "012 (Entwurf)";
        QTest::newRow("huge") << "99999999999 (Entwurf)" << "" << 11 << INT_MAX << "" << true << "99999999999"
                              << "99999999999 (Entwurf)" << "02147483647 (Entwurf)";
        // clang-format on
    }

    void parts()
    {
        QFETCH(QString, text);
        QFETCH(QString, userId);
        QFETCH(int, digits);
        QFETCH(int, number);
        QFETCH(QString, letter);
        QFETCH(bool, draft);
        QFETCH(QString, withoutDraft);
        QFETCH(QString, withUserId);
        QFETCH(QString, newDraft);
        const VDREntryNumber parsed(text, userId);
        QCOMPARE(parsed.digits(), digits);
        QCOMPARE(parsed.number(), number);
        QCOMPARE(QString(parsed.letter()).remove(QChar(0)), letter);
        QCOMPARE(parsed.letterIndex(), letter.isEmpty() ? 0 : letter.at(0).unicode() - 'a' + 1);
        QCOMPARE(parsed.isDraft(), draft);
        QCOMPARE(parsed.withoutDraft(), withoutDraft);
        QCOMPARE(parsed.withUserId(), withUserId);
        QCOMPARE(VDREntryNumber::compose(withoutDraft, userId, draft), withUserId);
        QCOMPARE(VDREntryNumber::newDraft(number, qMax(3, digits)), newDraft);
    }

    void order_data()
    {
        QTest::addColumn<QString>("a");
        QTest::addColumn<QString>("b");
        QTest::addColumn<int>("order");
        // The same number where a predecessor diary has it ("12a" there is "012a" here).
        QTest::addColumn<bool>("same");
        // clang-format off
        QTest::newRow("inserted after") << "011a (Entwurf)" << "011" << 1 << false;
        QTest::newRow("letters") << "012a" << "012b (Entwurf)" << -1 << false;
        QTest::newRow("predecessor") << "12a" << "012a" << 0 << true;
        QTest::newRow("predecessor, upper case") << "12A" << "012a" << -1 << true;
        QTest::newRow("widened") << "999" << "0999 (Entwurf)" << 0 << true;
        QTest::newRow("wider number") << "0999" << "1000 (Entwurf)" << -1 << false;
        QTest::newRow("no digits") << "Nr. 5" << "001" << -1 << false;
        QTest::newRow("non-Latin digits") << "\u0661\u0663" << "012" << 1 << false;
        QTest::newRow("blanks from outside") << " 012b \t" << "012b (Entwurf)" << 0 << true;
        // clang-format on
    }

    void order()
    {
        QFETCH(QString, a);
        QFETCH(QString, b);
        QFETCH(int, order);
        QFETCH(bool, same);
        const VDREntryNumber first = VDREntryNumber::forComparing(a);
        const VDREntryNumber second = VDREntryNumber::forComparing(b);
        QCOMPARE(first.compare(second), order);
        QCOMPARE(second.compare(first), -order);
        QCOMPARE(first < second, order < 0);
        QCOMPARE(VDREntryNumber::sameNumber(first.withoutDraft(), second.withoutDraft()), same);
    }
};

QTEST_GUILESS_MAIN(TestVDREntryNumber)
#include "tst_vdrentrynumber.moc"
