#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "export/VDRCompleterExchange.h"
#include "export/VDRSettingsXml.h"

#include <QBuffer>
#include <QDateTime>
#include <QFileInfo>
#include <QLocale>
#include <QSettings>
#include <QTemporaryDir>
#include <QtTest>

class TestVDRSettingsXml : public VDRTestCase
{
    Q_OBJECT

    void initTest() override { clearSettings(); }

private slots:
    void segmentElementNames_data()
    {
        QTest::addColumn<QString>("segment");
        QTest::addColumn<QString>("element");
        const auto row = [](const char* tag, const char* segment, const char* element) {
            QTest::newRow(tag) << QString::fromUtf8(segment) << QString::fromUtf8(element);
        };
        row("blank", "Witterung Wind", "Witterung_Wind");
        row("number 0", "0", "value_0");
        row("number 12", "12", "value_12");
        row("Spanish equipment", "Equipo, máquina", "Equipo_máquina");
        row("Spanish index", "Nº índice", "No_índice");
        row("umlauts", "Witterung Bewölkung", "Witterung_Bewölkung");
        row("sharp s", "Baumaßnahmen", "Baumaßnahmen");
        row("dash and dot", "Raumbuch-Nr.", "Raumbuch-Nr.");
        // Beyond the fixed rules: names that would otherwise read back changed or not parse at all.
        row("underscore", "Witterung_Wind", "Witterung_x005F_Wind");
        row("leading digit", "2D-Plan", "_x0032_D-Plan");
        row("comma, slash-free", "Lage, Ort", "Lage_x002C__Ort");
        row("looks numeric", "value 3", "value_x0020_3");
        row("looks special", "Equipo máquina", "Equipo_x0020_máquina");
        row("looks escaped", " x0041 ", "_x0020_x0041_x0020_");
    }

    void segmentElementNames()
    {
        QFETCH(QString, segment);
        QFETCH(QString, element);
        const QString key = "German/" + segment + "/values/size";
        const QByteArray xml = xmlOf({{key, 3}});
        QVERIFY2(xml.contains("<" + element.toUtf8() + ">"), xml.constData());
        QString error;
        const QSettings::SettingsMap back = readBack(xml, &error);
        QVERIFY2(error.isEmpty(), qPrintable(error));
        QCOMPARE(back.keys(), QStringList{key});
        QCOMPARE(back.value(key).toString(), QStringLiteral("3"));
    }

    void valuesReadBack_data()
    {
        QTest::addColumn<QVariant>("value");
        QTest::addColumn<QString>("expected");
        QTest::newRow("umlauts") << QVariant("Küche, Flur") << "Küche, Flur";
        QTest::newRow("multi-line") << QVariant("Zeile 1\nZeile 2\n") << "Zeile 1\nZeile 2\n";
        QTest::newRow("carriage return") << QVariant("a\r\nb\rc") << "a\r\nb\rc";
        QTest::newRow("markup") << QVariant("<b> & \"x\"") << "<b> & \"x\"";
        QTest::newRow("single blank") << QVariant(" ") << " ";
        QTest::newRow("surrounding blanks") << QVariant("  a  ") << "  a  ";
        QTest::newRow("empty") << QVariant("") << "";
        QTest::newRow("int") << QVariant(42) << "42";
        QTest::newRow("bool") << QVariant(true) << "true";
        // A vertical tab is not allowed in XML: left out rather than making the whole file unreadable.
        QTest::newRow("control character") << QVariant("a\vb") << "ab";
    }

    void valuesReadBack()
    {
        QFETCH(QVariant, value);
        QFETCH(QString, expected);
        QString error;
        const QSettings::SettingsMap back = readBack(xmlOf({{"German/values/0/centry", value}}), &error);
        QVERIFY2(error.isEmpty(), qPrintable(error));
        QCOMPARE(back.value("German/values/0/centry").toString(), expected);
    }

    void smallMapExactXml()
    {
        const QSettings::SettingsMap map{{"German/values/1/centry", "zwei"},
                                         {"German/values/0/centry", "eins"},
                                         {"German/values/size", 2},
                                         {"German/Witterung Wind/tableID", 0},
                                         {"English/init", true}};
        const QByteArray expected = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
                                    "<Settings>\n"
                                    "    <English>\n"
                                    "        <init>true</init>\n"
                                    "    </English>\n"
                                    "    <German>\n"
                                    "        <Witterung_Wind>\n"
                                    "            <tableID>0</tableID>\n"
                                    "        </Witterung_Wind>\n"
                                    "        <values>\n"
                                    "            <value_0>\n"
                                    "                <centry>eins</centry>\n"
                                    "            </value_0>\n"
                                    "            <value_1>\n"
                                    "                <centry>zwei</centry>\n"
                                    "            </value_1>\n"
                                    "            <size>2</size>\n"
                                    "        </values>\n"
                                    "    </German>\n"
                                    "</Settings>\n";
        QCOMPARE(QString::fromUtf8(xmlOf(map)), QString::fromUtf8(expected));
    }

    void completerRoundTrip()
    {
        fillRealisticStore();
        const QMap<QString, QString> before = completerSnapshot();
        QVERIFY(before.contains("completer_111/Equipo, máquina/Nº índice/values/1/centry"));
        QTemporaryDir cloud;
        QVERIFY(VDRCompleterExchange::exportSettings2XML(cloud.path()));
        const QString path = VDRCompleterExchange::completerFilePath(cloud.path());
        QCOMPARE(QFileInfo(path).fileName(), QStringLiteral("Completer.xml"));

        // QSettings reads the file through the registered format just the same.
        QSettings file(path, xmlSettingsFormat());
        QCOMPARE(file.status(), QSettings::NoError);
        QCOMPARE(file.value("Spanish/Equipo, máquina/Nº índice/values/1/centry").toString(),
                 QStringLiteral("Grúa"));
        QCOMPARE(file.value("German/Baumaßnahmen/Beschreibung/values/size").toInt(), 13);
        // Installations set to US English read their lists from "USA".
        QCOMPARE(file.value("USA/Weather wind/simple/values/2/centry").toString(), QStringLiteral("gusty"));
        QCOMPARE(file.value("English/Weather wind/simple/values/2/centry").toString(),
                 QStringLiteral("gusty"));

        clearSettings();
        QVERIFY(completerSnapshot().isEmpty());
        QVERIFY(VDRCompleterExchange::importSettingsFromXML(cloud.path()));
        QCOMPARE(completerSnapshot(), before);

        QSettings settings;
        QDateTime modified = QFileInfo(path).lastModified();
        modified = modified.addMSecs(-modified.time().msec());
        QCOMPARE(settings.value(VDRCompleterExchange::LastSyncCompleterSettingsKey).toDateTime(), modified);
    }

    void importReplacesOnlyLanguagesInFile()
    {
        QTemporaryDir cloud;
        // As another installation may write it: English only under "USA".
        QVERIFY(VDRTestFixtures::writeFile(
            VDRCompleterExchange::completerFilePath(cloud.path()),
            "<?xml version=\"1.0\"?>\n<Settings><German><Notizen><tableID>0</tableID><simple><enabled>true"
            "</enabled><values><value_1><centry>neu</centry></value_1><size>1</size></values></simple>"
            "</Notizen></German><USA><Notes><tableID>0</tableID></Notes></USA></Settings>\n"));
        fillRealisticStore();
        const QMap<QString, QString> before = completerSnapshot();

        QVERIFY(VDRCompleterExchange::importSettingsFromXML(cloud.path()));
        QMap<QString, QString> expected;
        for (auto it = before.constBegin(); it != before.constEnd(); ++it)
            if (it.key().startsWith("completer_111/"))
                expected.insert(it.key(), it.value());
        expected.insert("completer_42/Notizen/tableID", "0");
        expected.insert("completer_42/Notizen/simple/enabled", "true");
        expected.insert("completer_42/Notizen/simple/values/1/centry", "neu");
        expected.insert("completer_42/Notizen/simple/values/size", "1");
        expected.insert("completer_31/Notes/tableID", "0");
        QCOMPARE(completerSnapshot(), expected);
    }

    void malformedFileChangesNothing_data()
    {
        QTest::addColumn<QByteArray>("content");
        QTest::addColumn<int>("line");
        QTest::newRow("unclosed element") << QByteArray("<?xml version=\"1.0\"?>\n<Settings>\n  <German>\n"
                                                        "    <init>true</init>\n")
                                          << 5;
        QTest::newRow("mismatched tag")
            << QByteArray("<Settings>\n<German>\n<a>x</b>\n</German>\n</Settings>\n") << 3;
        QTest::newRow("garbage") << QByteArray("PK\x03\x04 this is no xml\n") << 1;
        QTest::newRow("other root") << QByteArray("<?xml version=\"1.0\"?>\n\n<plist>\n</plist>\n") << 3;
        // Keys repeat their parents' names: nesting must not make the result grow with its square.
        QTest::newRow("nested 10000 deep") << "<Settings>" + QByteArray("<a>x").repeated(10000) +
                                                  QByteArray("</a>").repeated(10000) + "</Settings>"
                                           << 1;
        const QByteArray longName(500, 'n');
        QTest::newRow("long keys") << "<Settings>\n" + ("<" + longName + ">").repeated(15) +
                                          QByteArray("<b>x</b>").repeated(1000) +
                                          ("</" + longName + ">").repeated(15) + "</Settings>"
                                   << 2;
    }

    void malformedFileChangesNothing()
    {
        QFETCH(QByteArray, content);
        QFETCH(int, line);
        fillRealisticStore();
        const QDateTime lastSync(QDate(2024, 1, 2), QTime(3, 4, 5));
        QSettings().setValue(VDRCompleterExchange::LastSyncCompleterSettingsKey, lastSync);
        const QMap<QString, QString> before = completerSnapshot();
        QTemporaryDir cloud;
        const QString path = VDRCompleterExchange::completerFilePath(cloud.path());
        QVERIFY(VDRTestFixtures::writeFile(path, content));

        m_prompt.expect("Fehler bei Synchronisation der Autovervollständigen-Texte",
                        "Fehler beim Lesen der Austausch-Datei für Autovervollständigen-Texte\n" + path +
                            ":\n");
        QVERIFY(!VDRCompleterExchange::importSettingsFromXML(cloud.path()));
        QCOMPARE(m_prompt.messages.size(), 1);
        const QString text = m_prompt.messages.first().text;
        QVERIFY2(text.contains(QStringLiteral(" at line %1\n").arg(line)), qPrintable(text));
        QVERIFY(text.endsWith("\n\nDie Autovervollständigen-Texte konnten nicht synchronisiert werden."));
        QCOMPARE(completerSnapshot(), before);
        QCOMPARE(QSettings().value(VDRCompleterExchange::LastSyncCompleterSettingsKey).toDateTime(),
                 lastSync);
    }

    void createsMissingFileOnly()
    {
        fillRealisticStore();
        QTemporaryDir cloud;
        const QString path = VDRCompleterExchange::completerFilePath(cloud.path());
        QVERIFY(VDRCompleterExchange::createCompleterXMLFile(cloud.path()));
        QSettings::SettingsMap map;
        QString error;
        QVERIFY2(readXmlSettingsFile(path, map, &error), qPrintable(error));
        QCOMPARE(map.value("German/Witterung Wind/simple/values/2/centry").toString(),
                 QStringLiteral("böig"));
        QVERIFY(QSettings().contains(VDRCompleterExchange::LastSyncCompleterSettingsKey));

        // An existing file belongs to the synchronisation: left as it is.
        const QByteArray hash = VDRTestFixtures::fileHash(path);
        QSettings().setValue("completer_42/Witterung Wind/simple/values/1/centry", "geändert");
        QVERIFY(VDRCompleterExchange::createCompleterXMLFile(cloud.path()));
        QCOMPARE(VDRTestFixtures::fileHash(path), hash);
    }

private:
    static QByteArray xmlOf(const QSettings::SettingsMap& map)
    {
        QBuffer buffer;
        buffer.open(QIODevice::WriteOnly);
        if (!writeXmlFile(buffer, map))
            return QByteArray();
        return buffer.data();
    }

    static QSettings::SettingsMap readBack(const QByteArray& xml, QString* error = nullptr)
    {
        QByteArray data = xml;
        QBuffer buffer(&data);
        buffer.open(QIODevice::ReadOnly);
        QSettings::SettingsMap map;
        readXmlSettings(buffer, map, error);
        return map;
    }

    // Every key of the completer groups, values as text: what a completer would read.
    static QMap<QString, QString> completerSnapshot()
    {
        QSettings settings;
        QMap<QString, QString> snapshot;
        for (const QString& key : settings.allKeys())
            if (key.startsWith(QLatin1String("completer_")))
                snapshot.insert(key, settings.value(key).toString());
        return snapshot;
    }

    static void clearSettings()
    {
        QSettings settings;
        settings.clear();
        settings.sync();
    }

    // Lists as the completers and the editor write them, in three languages.
    void fillRealisticStore()
    {
        const auto writeList = [](int language, const QString& title, int tableID, const QString& column,
                                  int regIdx, const QStringList& entries) {
            QSettings settings;
            settings.beginGroup(VDRCompleterExchange::completerGroup(language));
            settings.setValue(QStringLiteral("init"), true);
            settings.beginGroup(title);
            settings.setValue(QStringLiteral("tableID"), tableID);
            settings.beginGroup(column);
            settings.setValue(QStringLiteral("enabled"), false);
            settings.setValue(QStringLiteral("regIdx"), regIdx);
            settings.setValue(QStringLiteral("columnID"), 4);
            settings.setValue(QStringLiteral("updateTime"), QStringLiteral("Mo. Mai 6 10:15:00 2024"));
            settings.beginWriteArray(QStringLiteral("values"));
            for (int i = 0; i < entries.size(); ++i) {
                settings.setArrayIndex(i);
                settings.setValue(QStringLiteral("centry"), entries.at(i));
            }
            settings.endArray();
        };
        writeList(QLocale::German, "Witterung Wind", 0, "simple", 0, {"windstill", "böig", "stürmisch"});
        writeList(QLocale::German, "Mängel", 7, "Raumbuch-Nr.", 2, {"UG-001", "EG-001", "OG-001", "DG-001"});
        writeList(QLocale::German, "Baustoffe", 11, "Einheit", 5, {"m", "m²", "m³", "kg", "t"});
        writeList(QLocale::German, "Baumaßnahmen", 9, "Beschreibung", 3,
                  {"Beispiel \"Beton\":", "Beton einbringen,\nBetontemp. < 5 °C & Wind\r\nzweite Zeile", " ",
                   "", "Ausschal-Arbeiten...", "a", "b", "c", "d", "e", "f", "g", "h (Eintrag 12)"});
        writeList(QLocale::English, "Weather wind", 0, "simple", 0, {"calm", "gusty"});
        writeList(QLocale::Spanish, "Equipo, máquina", 14, "Nº índice", 7, {"Grúa", "Excavadora  doble"});
        QSettings().setValue(QStringLiteral("language"), int(QLocale::German));
    }
};

QTEST_GUILESS_MAIN(TestVDRSettingsXml)
#include "tst_vdrsettingsxml.moc"
