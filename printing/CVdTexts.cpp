#include "printing/CVdTexts.h"

#include "printing/VDRPrintTextModel.h"

#include <QCoreApplication>

namespace {
// By id: the printouts address the texts only by their position.
const char* const kDefaults[] = {
    QT_TRANSLATE_NOOP("CVdTexts", "Wetter:"),                                           // 0
    QT_TRANSLATE_NOOP("CVdTexts", "Temperatur: %1°C"),                                  // 1
    QT_TRANSLATE_NOOP("CVdTexts", "Luftfeuchtigkeit: %1%"),                             // 2
    QT_TRANSLATE_NOOP("CVdTexts", " um %1 Uhr"),                                        // 3
    QT_TRANSLATE_NOOP("CVdTexts", "Uhr"),                                               // 4
    QT_TRANSLATE_NOOP("CVdTexts", "Temperatur: %1°C, Luftfeuchtigkeit: %2% um %3 Uhr"), // 5
    QT_TRANSLATE_NOOP("CVdTexts", "Anwesende:"),                                        // 6
    QT_TRANSLATE_NOOP("CVdTexts", "Bau-Besetzung:"),                                    // 7
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Personen"),                                       // 8
    QT_TRANSLATE_NOOP("CVdTexts", "Leistungsstand:"),                                   // 9
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                                     // 10
    QT_TRANSLATE_NOOP("CVdTexts", "Verzüge:"),                                          // 11
    QT_TRANSLATE_NOOP("CVdTexts", "Behinderungen:"),                                    // 12
    QT_TRANSLATE_NOOP("CVdTexts", "Abnahmen:"),                                         // 13
    QT_TRANSLATE_NOOP("CVdTexts", "Mängelliste"),                                       // 14
    QT_TRANSLATE_NOOP("CVdTexts", "Mängel:"),                                           // 15
    QT_TRANSLATE_NOOP("CVdTexts", "Mängel ohne Firmenzuordnung:"),                      // 16
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                                     // 17
    QT_TRANSLATE_NOOP("CVdTexts", "Weisungen:"),                                        // 18
    QT_TRANSLATE_NOOP("CVdTexts", "Zusatzleistungen:"),                                 // 19
    QT_TRANSLATE_NOOP("CVdTexts", "Zusatzleistungen:"),                                 // 20
    QT_TRANSLATE_NOOP("CVdTexts", "Wichtige Baumaßnahmen:"),                            // 21
    QT_TRANSLATE_NOOP("CVdTexts", "Prüfungen / Messungen:"),                            // 22
    QT_TRANSLATE_NOOP("CVdTexts", "Eingriffe in Tragwerke:"),                           // 23
    QT_TRANSLATE_NOOP("CVdTexts", "Besondere Vorkommnisse:"),                           // 24
    QT_TRANSLATE_NOOP("CVdTexts", "Baustoffe:"),                                        // 25
    QT_TRANSLATE_NOOP("CVdTexts", "von Firma: %1"),                                     // 26
    QT_TRANSLATE_NOOP("CVdTexts", "Baustofftemperatur: %1°C"),                          // 27
    QT_TRANSLATE_NOOP("CVdTexts", "Verarbeitungsbedingungen: %1"),                      // 28
    QT_TRANSLATE_NOOP("CVdTexts", "Arbeitsabläufe: %1"),                                // 29
    QT_TRANSLATE_NOOP("CVdTexts", "Probekörper:"),                                      // 30
    QT_TRANSLATE_NOOP("CVdTexts",
                      "Es wurden Probekörper hergestellt. Siehe hierzu anliegendes Protokoll."), // 31
    QT_TRANSLATE_NOOP("CVdTexts", "Pläne und Dokumente:"),                                       // 32
    QT_TRANSLATE_NOOP("CVdTexts", "Übergeben an: %1"),                                           // 33
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Leistungsstand"),                          // 34
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Mängel"),                                  // 35
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Behinderungen"),                           // 36
    QT_TRANSLATE_NOOP("CVdTexts", "Datum: %1"),                                                  // 37
    // The rights notice on the bottom line of every page.
    QT_TRANSLATE_NOOP("CVdTexts", "Erstellt mit Varduna, © Korvant - Software"),      // 38
    QT_TRANSLATE_NOOP("CVdTexts", "Baubericht-Nr.: %1 %2"),                           // 39
    QT_TRANSLATE_NOOP("CVdTexts", "Seite ${page.cur}/${page.count}"),                 // 40
    QT_TRANSLATE_NOOP("CVdTexts", "Seite ${page.cur}/${page.count} "),                // 41
    QT_TRANSLATE_NOOP("CVdTexts", "Baubericht-Nr.:"),                                 // 42
    QT_TRANSLATE_NOOP("CVdTexts", "Baubegehung vom %1"),                              // 43
    QT_TRANSLATE_NOOP("CVdTexts", "Baubegehung vom:"),                                // 44
    QT_TRANSLATE_NOOP("CVdTexts", "Ort        Datum        Unterschrift Bauleitung"), // 45
    QT_TRANSLATE_NOOP("CVdTexts", "Dokument: %1"),                                    // 46
    QT_TRANSLATE_NOOP("CVdTexts", "Sonstige Notizen:"),                               // 47
    QT_TRANSLATE_NOOP("CVdTexts", "Telefonnotizen:"),                                 // 48
    QT_TRANSLATE_NOOP("CVdTexts", "Bedenkenanmeldungen:"),                            // 49
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Mannstunden"),                                  // 50
    QT_TRANSLATE_NOOP("CVdTexts", "Baubesetzung und Stundenlisten:"),                 // 51
    QT_TRANSLATE_NOOP("CVdTexts", "Baustellenbesetzung am %1:"),                      // 52
    QT_TRANSLATE_NOOP("CVdTexts", "Gesamtstunden nach Firmen:"),                      // 53
    QT_TRANSLATE_NOOP("CVdTexts", "am %2"),                                           // 54
    QT_TRANSLATE_NOOP("CVdTexts", "vom %2 bis %3"),                                   // 55
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Mannstunden"),                                  // 56
    QT_TRANSLATE_NOOP("CVdTexts", "- ohne Firmenzuordnung -"),                        // 57
    QT_TRANSLATE_NOOP("CVdTexts", "keine Stunden erfasst"),                           // 58
    QT_TRANSLATE_NOOP("CVdTexts", "Geräte und Maschinen:"),                           // 59
    QT_TRANSLATE_NOOP("CVdTexts", "Zugang: %1 Uhr"),                                  // 60
    QT_TRANSLATE_NOOP("CVdTexts", "Abgang: %1 Uhr"),                                  // 61
    QT_TRANSLATE_NOOP("CVdTexts", "Stillstand: "),                                    // 62
    QT_TRANSLATE_NOOP("CVdTexts", "Einsatzzeit: "),                                   // 63
    QT_TRANSLATE_NOOP("CVdTexts", "Stillstandsgründe: %1"),                           // 64
    QT_TRANSLATE_NOOP("CVdTexts", "Einsatzzeiten:\n"),                                // 65
    QT_TRANSLATE_NOOP("CVdTexts", "Stillstandszeiten:\n"),                            // 66
    QT_TRANSLATE_NOOP("CVdTexts", "Leistungszeit: "),                                 // 67
    QT_TRANSLATE_NOOP("CVdTexts", "Notiz: "),                                         // 68
    QT_TRANSLATE_NOOP("CVdTexts", "Summen:"),                                         // 69
    QT_TRANSLATE_NOOP("CVdTexts", "Geräteeinsatz Zusammenfassung"),                   // 70
    QT_TRANSLATE_NOOP("CVdTexts", "Geräteeinsatz nach Firmen"),                       // 71
    // Not printed by the printouts so far.
    QT_TRANSLATE_NOOP("CVdTexts", "Geräteeinsatz nach Geräten"),               // 72
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Wichtige Baumaßnahmen"), // 73
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 von Baustoffe"),             // 74
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                            // 75
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Fotos)"),                            // 76
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zum Leistungsstand"),                // 77
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zur Mängelerfassung"),               // 78
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zu Behinderungen"),                  // 79
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zu Wichtige Baumaßnahmen"),          // 80
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder zu Baustoffen"),                     // 81
    QT_TRANSLATE_NOOP("CVdTexts", "1 Bild im Anhang"),                         // 82
    QT_TRANSLATE_NOOP("CVdTexts", "%1 Bilder im Anhang"),                      // 83
    QT_TRANSLATE_NOOP("CVdTexts", "Bild %1 von %2 zu Mangel:"),                // 84
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder mit Mangelzuordnung"),               // 85
    QT_TRANSLATE_NOOP("CVdTexts", "Bilder ohne Mangelzuordnung"),              // 86
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe Foto)"),                             // 87
    QT_TRANSLATE_NOOP("CVdTexts", "(siehe %1 Fotos)"),                         // 88
    QT_TRANSLATE_NOOP("CVdTexts", "Firma: "),                                  // 89
    QT_TRANSLATE_NOOP("CVdTexts", "Fototitel: "),                              // 90
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
