#include "printing/CVdTexts.h"

#include "printing/VDRPrintTextModel.h"

#include <QCoreApplication>

namespace {
// By id: the printouts address the texts only by their position.
const char* const kDefaults[] = {
    QT_TRANSLATE_NOOP("CVdTexts", "Wetter:"),                                           // id 0
    QT_TRANSLATE_NOOP("CVdTexts", "Temperatur: %1°C"),                                  // id 1
    QT_TRANSLATE_NOOP("CVdTexts", "Luftfeuchtigkeit: %1%"),                             // id 2
    QT_TRANSLATE_NOOP("CVdTexts", " um %1 Uhr"),                                        // id 3
    QT_TRANSLATE_NOOP("CVdTexts", "Uhr"),                                               // id 4
    QT_TRANSLATE_NOOP("CVdTexts", "Temperatur: %1°C, Luftfeuchtigkeit: %2% um %3 Uhr"), // id 5
    QT_TRANSLATE_NOOP("CVdTexts", "Anwesende:"),                                        // id 6
    QT_TRANSLATE_NOOP("CVdTexts", "Bau-Besetzung:"),                                    // id 7
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Personen"),                                       // id 8
    QT_TRANSLATE_NOOP("CVdTexts", "Leistungsstand:"),                                   // id 9
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                                     // id 10
    QT_TRANSLATE_NOOP("CVdTexts", "Verzüge:"),                                          // id 11
    QT_TRANSLATE_NOOP("CVdTexts", "Behinderungen:"),                                    // id 12
    QT_TRANSLATE_NOOP("CVdTexts", "Abnahmen:"),                                         // id 13
    QT_TRANSLATE_NOOP("CVdTexts", "Mängelliste"),                                       // id 14
    QT_TRANSLATE_NOOP("CVdTexts", "Mängel:"),                                           // id 15
    QT_TRANSLATE_NOOP("CVdTexts", "Mängel ohne Firmenzuordnung:"),                      // id 16
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                                     // id 17
    QT_TRANSLATE_NOOP("CVdTexts", "Weisungen:"),                                        // id 18
    QT_TRANSLATE_NOOP("CVdTexts", "Zusatzleistungen:"),                                 // id 19
    QT_TRANSLATE_NOOP("CVdTexts", "Zusatzleistungen:"),                                 // id 20
    QT_TRANSLATE_NOOP("CVdTexts", "Wichtige Baumaßnahmen:"),                            // id 21
    QT_TRANSLATE_NOOP("CVdTexts", "Prüfungen / Messungen:"),                            // id 22
    QT_TRANSLATE_NOOP("CVdTexts", "Eingriffe in Tragwerke:"),                           // id 23
    QT_TRANSLATE_NOOP("CVdTexts", "Besondere Vorkommnisse:"),                           // id 24
    QT_TRANSLATE_NOOP("CVdTexts", "Baustoffe:"),                                        // id 25
    QT_TRANSLATE_NOOP("CVdTexts", "von Firma: %1"),                                     // id 26
    QT_TRANSLATE_NOOP("CVdTexts", "Baustofftemperatur: %1°C"),                          // id 27
    QT_TRANSLATE_NOOP("CVdTexts", "Verarbeitungsbedingungen: %1"),                      // id 28
    QT_TRANSLATE_NOOP("CVdTexts", "Arbeitsabläufe: %1"),                                // id 29
    QT_TRANSLATE_NOOP("CVdTexts", "Probekörper:"),                                      // id 30
    QT_TRANSLATE_NOOP("CVdTexts",
                      "Es wurden Probekörper hergestellt. Siehe hierzu anliegendes Protokoll."), // id 31
    QT_TRANSLATE_NOOP("CVdTexts", "Pläne und Dokumente:"),                                       // id 32
    QT_TRANSLATE_NOOP("CVdTexts", "Übergeben an: %1"),                                           // id 33
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Leistungsstand"),                          // id 34
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Mängel"),                                  // id 35
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Behinderungen"),                           // id 36
    QT_TRANSLATE_NOOP("CVdTexts", "Datum: %1"),                                                  // id 37
    // The rights notice on the bottom line of every page.
    QT_TRANSLATE_NOOP("CVdTexts", "Erstellt mit Varduna, © Korvant - Software"),      // id 38
    QT_TRANSLATE_NOOP("CVdTexts", "Baubericht-Nr.: %1 %2"),                           // id 39
    QT_TRANSLATE_NOOP("CVdTexts", "Seite ${page.cur}/${page.count}"),                 // id 40
    QT_TRANSLATE_NOOP("CVdTexts", "Seite ${page.cur}/${page.count} "),                // id 41
    QT_TRANSLATE_NOOP("CVdTexts", "Baubericht-Nr.:"),                                 // id 42
    QT_TRANSLATE_NOOP("CVdTexts", "Baubegehung vom %1"),                              // id 43
    QT_TRANSLATE_NOOP("CVdTexts", "Baubegehung vom:"),                                // id 44
    QT_TRANSLATE_NOOP("CVdTexts", "Ort        Datum        Unterschrift Bauleitung"), // id 45
    QT_TRANSLATE_NOOP("CVdTexts", "Dokument: %1"),                                    // id 46
    QT_TRANSLATE_NOOP("CVdTexts", "Sonstige Notizen:"),                               // id 47
    QT_TRANSLATE_NOOP("CVdTexts", "Telefonnotizen:"),                                 // id 48
    QT_TRANSLATE_NOOP("CVdTexts", "Bedenkenanmeldungen:"),                            // id 49
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Mannstunden"),                                  // id 50
    QT_TRANSLATE_NOOP("CVdTexts", "Baubesetzung und Stundenlisten:"),                 // id 51
    QT_TRANSLATE_NOOP("CVdTexts", "Baustellenbesetzung am %1:"),                      // id 52
    QT_TRANSLATE_NOOP("CVdTexts", "Gesamtstunden nach Firmen:"),                      // id 53
    QT_TRANSLATE_NOOP("CVdTexts", "am %2"),                                           // id 54
    QT_TRANSLATE_NOOP("CVdTexts", "vom %2 bis %3"),                                   // id 55
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Mannstunden"),                                  // id 56
    QT_TRANSLATE_NOOP("CVdTexts", "- ohne Firmenzuordnung -"),                        // id 57
    QT_TRANSLATE_NOOP("CVdTexts", "keine Stunden erfasst"),                           // id 58
    QT_TRANSLATE_NOOP("CVdTexts", "Geräte und Maschinen:"),                           // id 59
    QT_TRANSLATE_NOOP("CVdTexts", "Zugang: %1 Uhr"),                                  // id 60
    QT_TRANSLATE_NOOP("CVdTexts", "Abgang: %1 Uhr"),                                  // id 61
    QT_TRANSLATE_NOOP("CVdTexts", "Stillstand: "),                                    // id 62
    QT_TRANSLATE_NOOP("CVdTexts", "Einsatzzeit: "),                                   // id 63
    QT_TRANSLATE_NOOP("CVdTexts", "Stillstandsgründe: %1"),                           // id 64
    QT_TRANSLATE_NOOP("CVdTexts", "Einsatzzeiten:\n"),                                // id 65
    QT_TRANSLATE_NOOP("CVdTexts", "Stillstandszeiten:\n"),                            // id 66
    QT_TRANSLATE_NOOP("CVdTexts", "Leistungszeit: "),                                 // id 67
    QT_TRANSLATE_NOOP("CVdTexts", "Notiz: "),                                         // id 68
    QT_TRANSLATE_NOOP("CVdTexts", "Summen:"),                                         // id 69
    QT_TRANSLATE_NOOP("CVdTexts", "Geräteeinsatz Zusammenfassung"),                   // id 70
    QT_TRANSLATE_NOOP("CVdTexts", "Geräteeinsatz nach Firmen"),                       // id 71
    // Not printed by the printouts so far.
    QT_TRANSLATE_NOOP("CVdTexts", "Geräteeinsatz nach Geräten"),               // id 72
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Wichtige Baumaßnahmen"), // id 73
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Baustoffe"),             // id 74
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                            // id 75
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                            // id 76
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zum Leistungsstand"),                // id 77
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zur Mängelerfassung"),               // id 78
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zu Behinderungen"),                  // id 79
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zu Wichtige Baumaßnahmen"),          // id 80
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zu Baustoffen"),                     // id 81
    QT_TRANSLATE_NOOP("CVdTexts", "1 Bild im Anhang"),                         // id 82
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Bilder im Anhang"),                      // id 83
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 zu Mangel:"),                // id 84
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder mit Mangelzuordnung"),               // id 85
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder ohne Mangelzuordnung"),              // id 86
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Foto)"),                             // id 87
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe %1 Fotos)"),                         // id 88
    QT_TRANSLATE_NOOP("CVdTexts", "Firma: "),                                  // id 89
    QT_TRANSLATE_NOOP("CVdTexts", "Fototitel: "),                              // id 90
};
} // namespace

CVdTexts* CVdTexts::self()
{
    // Lives as long as the process.
    static CVdTexts texts;
    return &texts;
}

CVdTexts::CVdTexts()
{
    for (const char* t : kDefaults)
        TextList << QCoreApplication::translate("CVdTexts", t);
    m_model = new VDRPrintTextModel(TextList, this);
    m_model->readSettings();
}

QString CVdTexts::text(int id) const
{
    return m_model->text(id);
}

void CVdTexts::resetModel()
{
    TextList.clear();
    for (const char* t : kDefaults)
        TextList << QCoreApplication::translate("CVdTexts", t);
    m_model->initSettings(TextList);
    m_model->readSettings();
}
