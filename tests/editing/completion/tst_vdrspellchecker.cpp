#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "editing/completion/VDRSpellChecker.h"

#include <QDir>
#include <QFile>
#include <QSettings>
#include <QTemporaryDir>
#include <QTextCodec>
#include <QtTest>

class TestVDRSpellChecker : public VDRTestCase
{
    Q_OBJECT

    void initTest() override { QSettings().remove(QStringLiteral("spellCheckerActive")); }

private slots:
    void checksWords_data()
    {
        QTest::addColumn<QByteArray>("encoding");
        QTest::addColumn<QString>("word");
        QTest::addColumn<bool>("correct");
        for (const QByteArray& encoding : {QByteArray("UTF-8"), QByteArray("ISO8859-1")}) {
            auto row = [&](const char* word, bool correct) {
                QTest::addRow("%s %s", encoding.constData(), word)
                    << encoding << QString::fromUtf8(word) << correct;
            };
            row("Baustelle", true);
            row("Baustellen", true); // suffix rules
            row("Prüfungn", false);
            row("Baustraße", true);
            row("Prüfungen", true);
            row("Gerüst", true);
            row("Prufung", false);
            row("Bausteller", false);
            row("Gerüst€", false); // not even in the dictionary's character set
        }
    }

    void checksWords()
    {
        QFETCH(QByteArray, encoding);
        QFETCH(QString, word);
        QFETCH(bool, correct);
        VDRSpellChecker checker(dictionary(encoding), m_dir.filePath(QStringLiteral("user_checks.txt")));
        QVERIFY(checker.isActive());
        QCOMPARE(checker.isCorrect(word), correct);
    }

    void suggests_data()
    {
        QTest::addColumn<QByteArray>("encoding");
        QTest::addColumn<QString>("word");
        QTest::addColumn<QString>("expected");
        const auto row = [](const char* encoding, const char* word, const char* expected) {
            QTest::addRow("%s %s", encoding, word)
                << QByteArray(encoding) << QString::fromUtf8(word) << QString::fromUtf8(expected);
        };
        row("UTF-8", "Prufung", "Prüfung");
        row("ISO8859-1", "Prufung", "Prüfung");
        row("ISO8859-1", "Baustrase", "Baustraße");
        row("UTF-8", "Bauselle", "Baustelle");
    }

    void suggests()
    {
        QFETCH(QByteArray, encoding);
        QFETCH(QString, word);
        QFETCH(QString, expected);
        VDRSpellChecker checker(dictionary(encoding), m_dir.filePath(QStringLiteral("user_suggests.txt")));
        const QStringList suggestions = checker.suggestions(word);
        QVERIFY2(suggestions.contains(expected), qPrintable(suggestions.join(QLatin1String(", "))));
    }

    void keepsUserWords_data()
    {
        QTest::addColumn<QByteArray>("encoding");
        QTest::addColumn<QByteArray>("before"); // null: no file yet
        QTest::addColumn<QStringList>("after");
        const QStringList added{QStringLiteral("Würfelprobe"), QStringLiteral("Ortbeton")};
        QTest::newRow("no file, UTF-8") << QByteArray("UTF-8") << QByteArray() << added;
        QTest::newRow("no file, ISO8859-1") << QByteArray("ISO8859-1") << QByteArray() << added;
        QTest::newRow("empty file") << QByteArray("ISO8859-1") << QByteArray("") << added;
        QTest::newRow("no final line break") << QByteArray("UTF-8") << QByteArray("Schalplan")
                                             << QStringList{QStringLiteral("Schalplan")} + added;
        QTest::newRow("word already there")
            << QByteArray("ISO8859-1") << QByteArray("Ortbeton\n")
            << QStringList{QStringLiteral("Ortbeton"), QStringLiteral("Würfelprobe")};
    }

    void keepsUserWords()
    {
        QFETCH(QByteArray, encoding);
        QFETCH(QByteArray, before);
        QFETCH(QStringList, after);
        const QString userFile = m_dir.filePath(QStringLiteral("user_%1.txt").arg(QTest::currentDataTag()));
        if (!before.isNull())
            QVERIFY(VDRTestFixtures::writeFile(userFile, before));
        {
            VDRSpellChecker checker(dictionary(encoding), userFile);
            for (const QString& word : {QStringLiteral("Würfelprobe"), QStringLiteral("Ortbeton")}) {
                QVERIFY(checker.addToUserDictionary(word));
                QVERIFY(checker.isCorrect(word)); // at once, without a restart
            }
        }
        QFile f(userFile);
        QVERIFY(f.open(QIODevice::ReadOnly));
        QCOMPARE(QString::fromUtf8(f.readAll()), after.join(QLatin1Char('\n')) + QLatin1Char('\n'));

        VDRSpellChecker reloaded(dictionary(encoding), userFile);
        for (const QString& word : after)
            QVERIFY2(reloaded.isCorrect(word), qPrintable(word));
        QVERIFY(!reloaded.isCorrect(QStringLiteral("Würfelprob")));
    }

    void inactiveAcceptsEverything()
    {
        const QString user = m_dir.filePath(QStringLiteral("user_inactive.txt"));
        {
            VDRSpellChecker checker(dictionary("UTF-8"), user);
            checker.setActive(false);
            QVERIFY(!checker.isActive());
            QVERIFY(checker.isCorrect(QStringLiteral("Bausteller")));
            QVERIFY(checker.suggestions(QStringLiteral("Prufung")).isEmpty());
        }
        // The choice is kept for the next start.
        VDRSpellChecker checker(dictionary("UTF-8"), user);
        QVERIFY(!checker.isActive());
        QVERIFY(checker.isCorrect(QStringLiteral("Bausteller")));
        checker.setActive(true);
        QVERIFY(!checker.isCorrect(QStringLiteral("Bausteller")));
        QCOMPARE(QSettings().value(QStringLiteral("spellCheckerActive")).toBool(), true);
    }

    void refusesBrokenDictionary_data()
    {
        QTest::addColumn<QString>("dic"); // null: file missing
        QTest::addColumn<QString>("aff");
        QTest::addColumn<QString>("missing"); // the file named in the message; empty: initialisation fails
        QTest::newRow("no .DIC") << QString() << QStringLiteral("SET UTF-8\n") << QStringLiteral(".DIC");
        QTest::newRow("no .AFF") << "1\nBagger\n" << QString() << ".AFF";
        QTest::newRow("neither") << QString() << QString() << ".DIC";
        QTest::newRow("no word count")
            << QStringLiteral("Bagger\n") << QStringLiteral("SET UTF-8\n") << QString();
    }

    void refusesBrokenDictionary()
    {
        QFETCH(QString, dic);
        QFETCH(QString, aff);
        QFETCH(QString, missing);
        QTemporaryDir dir;
        const QString base = dir.filePath(QStringLiteral("vdr_DE"));
        for (const auto& [suffix, text] : {std::pair{".DIC", dic}, std::pair{".AFF", aff}}) {
            if (!text.isNull())
                QVERIFY(VDRTestFixtures::writeFile(base + QLatin1String(suffix), text.toUtf8()));
        }
        const QString message =
            missing.isEmpty() ? QStringLiteral("Fehler beim Initialisieren des Moduls Rechtschreibprüfung. "
                                               "Bitte kontaktieren Sie den Softwarehersteller.")
                              : QStringLiteral("Wörterbuch-Datei %1 exisitert nicht.").arg(base + missing);
        m_prompt.expect(QStringLiteral("Fehler"), message);

        VDRSpellChecker checker(base, dir.filePath(QStringLiteral("vdr_userDict_DE.txt")));
        QCOMPARE(m_prompt.messages.size(), 1);
        QCOMPARE(m_prompt.messages.first().text, message);
        QVERIFY(!checker.isValid());
        QVERIFY(!checker.isActive());
        QVERIFY(checker.isCorrect(QStringLiteral("Xyzzy")));
        QVERIFY(!checker.addToUserDictionary(QStringLiteral("Xyzzy")));
        QVERIFY(!QFile::exists(checker.userDictionary()));
    }

    void mapsLanguage_data()
    {
        QTest::addColumn<QLocale::Language>("language");
        QTest::addColumn<QLocale::Country>("country");
        QTest::addColumn<QString>("suffix");
        QTest::newRow("German") << QLocale::German << QLocale::Germany << "DE";
        QTest::newRow("Austrian German") << QLocale::German << QLocale::Austria << "DE";
        QTest::newRow("English") << QLocale::English << QLocale::UnitedKingdom << "EN";
        QTest::newRow("English, no country") << QLocale::English << QLocale::AnyCountry << "EN";
        QTest::newRow("US English") << QLocale::English << QLocale::UnitedStates << "USA";
        QTest::newRow("Spanish") << QLocale::Spanish << QLocale::Spain << "ES";
        QTest::newRow("Mexican Spanish") << QLocale::Spanish << QLocale::Mexico << "ES";
        QTest::newRow("French falls back") << QLocale::French << QLocale::France << "DE";
        QTest::newRow("C locale falls back") << QLocale::C << QLocale::AnyCountry << "DE";
    }

    void mapsLanguage()
    {
        QFETCH(QLocale::Language, language);
        QFETCH(QLocale::Country, country);
        QFETCH(QString, suffix);
        QCOMPARE(VDRSpellChecker::dictionarySuffix(language, country), suffix);
        QCOMPARE(VDRSpellChecker::translationLanguage(language, country), suffix.toLower());
    }

    void installedGermanDictionary()
    {
        const QString base =
            QCoreApplication::applicationDirPath() + QLatin1String("/../Dictionaries/vdr_DE");
        if (!QFile::exists(base + QLatin1String(".DIC")))
            QSKIP("no German dictionary in the build's Dictionaries folder");
        VDRSpellChecker checker(base, m_dir.filePath(QStringLiteral("user_installed.txt")));
        QVERIFY(checker.isActive());
        QVERIFY(checker.isCorrect(QStringLiteral("Baustelle")));
        QVERIFY(checker.isCorrect(QStringLiteral("Prüfung")));
        // "Bausteller" would pass: the German dictionary builds compounds.
        QVERIFY(!checker.isCorrect(QStringLiteral("Baustele")));
        QVERIFY(!checker.isCorrect(QStringLiteral("Prufung")));
    }

private:
    // A small dictionary in the given encoding; returns its base path.
    QString dictionary(const QByteArray& encoding)
    {
        const QString base = m_dir.filePath(QStringLiteral("dict_") + QString::fromLatin1(encoding));
        if (QFile::exists(base + QLatin1String(".DIC")))
            return base;
        QTextCodec* codec = QTextCodec::codecForName(encoding);
        auto write = [&](const QString& path, const QString& text) {
            QFile f(path);
            QVERIFY(f.open(QIODevice::WriteOnly));
            f.write(codec->fromUnicode(text));
        };
        write(base + QLatin1String(".AFF"),
              QStringLiteral("SET %1\nTRY esianrtolcdugmphbkwzäöüß\n"
                             "SFX N Y 1\nSFX N 0 n .\nSFX E Y 1\nSFX E 0 en .\n")
                  .arg(QString::fromLatin1(encoding)));
        write(base + QLatin1String(".DIC"),
              QStringLiteral("5\nBaustelle/N\nBaustraße\nPrüfung/E\nGerüst\nBagger\n"));
        return base;
    }
};

QTEST_GUILESS_MAIN(TestVDRSpellChecker)
#include "tst_vdrspellchecker.moc"
