// vdr_makedemo OUTPUT.vd2: writes the demo project, the site diary of a Kita new-build, through the
// document's own operations, so that it holds exactly what the application itself would store.
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"

#include <QCoreApplication>
#include <QDate>
#include <QFileInfo>
#include <QHash>
#include <QImage>
#include <QLinearGradient>
#include <QPainter>
#include <QPainterPath>
#include <QSettings>
#include <QTemporaryDir>

#include <cstdio>
#include <utility>
#include <vector>

namespace {

using TN = VDRSqlTableModel;
using Values = std::vector<std::pair<const char*, QVariant>>;

// Every date hangs on this Monday, so the file is the same whenever it is built.
const QDate kStart(2026, 3, 2);
const int kLockedReports = 8;

QDate day(int offset)
{
    return kStart.addDays(offset);
}

QTime at(const char* hhmm)
{
    return QTime::fromString(QLatin1String(hhmm), QStringLiteral("hh:mm"));
}

// ---- The diary's content ----

struct Company
{
    const char *key, *type, *firstname, *lastname, *company, *street, *plz, *city, *telephone, *telefax,
        *mobile, *email;
};

// List 1, the persons; a new diary already holds Bauherr, Bauleitung and Architekt in this order.
const Company kPersons[] = {
    {"bauherr", "Bauherr", "Jens", "Albrecht", "Kinderhaus Sonnenblume e.V.", "Lindenstraße 14", "21335",
     "Lüneburg", "04131 7781-0", "04131 7781-29", "", "j.albrecht@kinderhaus-sonnenblume.example"},
    {"bauleitung", "Bauleitung", "Katrin", "Vogt", "Lindner + Kahl Architekten PartG mbB", "Am Sande 5",
     "21335", "Lüneburg", "04131 24468-12", "04131 24468-99", "0171 4432189", "k.vogt@lindner-kahl.example"},
    {"architekt", "Architekt", "Martin", "Lindner", "Lindner + Kahl Architekten PartG mbB", "Am Sande 5",
     "21335", "Lüneburg", "04131 24468-10", "04131 24468-99", "0172 9081345",
     "m.lindner@lindner-kahl.example"},
    {"tragwerk", "Tragwerksplanung", "Felix", "Hauser", "Ingenieurbüro Hauser", "Bardowicker Straße 30",
     "21335", "Lüneburg", "04131 40917", "", "0160 2235487", "hauser@ib-hauser.example"},
    {"tga", "TGA-Planung", "Tobias", "Reim", "Reim Ingenieure GmbH", "Harburger Ring 17", "21073", "Hamburg",
     "040 7665302", "040 7665309", "", "t.reim@reim-ingenieure.example"},
    {"sigeko", "SiGeKo", "Andrea", "Petersen", "Petersen Arbeitsschutz", "Dorfstraße 3", "21365", "Adendorf",
     "04131 189044", "", "0151 7733410", "info@petersen-arbeitsschutz.example"},
};

// List 2, the companies on site by trade.
const Company kCompanies[] = {
    {"rohbau", "Rohbau", "Uwe", "Hartmann", "Hartmann Bau GmbH & Co. KG", "Industriestraße 8", "21337",
     "Lüneburg", "04131 85520", "04131 855229", "0170 5512873", "bau@hartmann-bau.example"},
    {"erdbau", "Erd- und Entwässerungsarbeiten", "Sven", "Lorenz", "Lorenz Tiefbau GmbH", "Am Gewerbepark 2",
     "21391", "Reppenstedt", "04131 66120", "04131 661222", "", "info@lorenz-tiefbau.example"},
    {"zimmerer", "Zimmerer- und Dachdeckerarbeiten", "Henning", "Wenzel", "Holzbau Wenzel GmbH",
     "Sägewerkweg 4", "29553", "Bienenbüttel", "05823 95410", "05823 954120", "0171 2290461",
     "post@holzbau-wenzel.example"},
    {"elektro", "Elektroinstallation", "Marco", "Brandt", "Elektro Brandt GmbH", "Vor dem Neuen Tore 22",
     "21339", "Lüneburg", "04131 37745", "04131 377459", "", "service@elektro-brandt.example"},
    {"sanitaer", "Heizung / Sanitär", "Jan", "Sommer", "Sommer Haustechnik GmbH", "Luhdorfer Straße 61",
     "21423", "Winsen (Luhe)", "04171 60780", "04171 607899", "0173 4418820",
     "info@sommer-haustechnik.example"},
    {"geruest", "Gerüstbau", "Dirk", "Krüger", "Gerüstbau Krüger", "Bleckeder Landstraße 90", "21337",
     "Lüneburg", "04131 52233", "", "0162 8830114", "kontakt@geruestbau-krueger.example"},
    {"beton", "Transportbeton", "", "", "Nordheide Transportbeton GmbH", "Kiesgrubenweg 1", "21409", "Embsen",
     "04134 90880", "04134 908820", "", "dispo@nordheide-beton.example"},
};

// Two weeks of site visits; two days have a second visit in the afternoon.
struct Report
{
    int day;
    const char *from, *to, *clouds, *rain, *wind, *temperature, *humidity, *progress;
    const char *tests = "", *incidents = "", *notice = "";
    bool sample = false;
};

const Report kReports[] = {
    {0, "07:30", "10:00", "bedeckt", "Nieselregen", "schwacher Wind aus West", "4", "91",
     "Rohbau: Mauerwerk OG Achsen A–C fertiggestellt, Achsen C–E begonnen.\n"
     "Elektro: Schlitze und Leerrohre EG Gruppenräume 1 und 2."},
    {1, "07:30", "09:30", "klar", "kein Niederschlag", "windstill", "-3", "78",
     "Rohbau: Wegen Nachtfrost Mauerarbeiten erst ab 10:00 Uhr, bis dahin Schalung Ringbalken Achsen A–C.\n"
     "Sanitär: Beginn Vorwandinstallation Sanitärräume EG."},
    {2, "07:00", "09:00", "bedeckt", "kein Niederschlag", "schwacher Wind aus Süd", "3", "85",
     "Rohbau: Bewehrung Ringbalken OG verlegt und vom Tragwerksplaner abgenommen, Betonage am Nachmittag."},
    {2, "13:00", "16:30", "heiter", "kein Niederschlag", "schwacher Wind aus Süd", "7", "70",
     "Betonage Ringbalken OG Achsen A–E mit Autobetonpumpe, 12,5 m³ C25/30. Nachbehandlung mit Folie.",
     "Frischbetonprüfung: Ausbreitmaß 48 cm (F3), Betontemperatur 14 °C.", "", "", true},
    {3, "07:30", "10:00", "bedeckt", "leichter Regen", "mäßiger Wind aus Südwest", "6", "93",
     "Rohbau: Ringbalken ausgeschalt, Giebel Achse 1 begonnen.\nElektro: Rohinstallation EG Gruppenräume "
     "1–3.\n"
     "Sanitär: Vorwandinstallation WC Kinder EG."},
    {4, "07:30", "09:30", "wolkig", "kein Niederschlag", "mäßiger Wind aus West", "8", "76",
     "Rohbau: Giebel Achsen 1 und 6 fertig.\nGerüstbau: Gerüst auf Traufhöhe erhöht, Dachfanggerüst "
     "montiert."},
    {7, "07:00", "10:00", "bedeckt", "kein Niederschlag", "schwacher Wind aus Nordwest", "5", "80",
     "Zimmerer: Konstruktionsvollholz angeliefert, Dachstuhl Achsen 1–3 mit Autokran aufgerichtet.\n"
     "Rohbau: Restarbeiten Giebel."},
    {8, "07:30", "11:45", "stark bewölkt", "Schauer", "Sturmböen aus West bis 70 km/h", "9", "72",
     "Zimmerer: Dachstuhl Achsen 3–5, ab 11:30 Uhr Kranarbeiten wegen Sturmböen eingestellt.\n"
     "Elektro: Rohinstallation OG begonnen.",
     "", "Unwetterwarnung für den Landkreis; lose Materialien auf der Decke OG gesichert."},
    {9, "07:30", "09:30", "wolkig", "kein Niederschlag", "mäßiger Wind aus West", "7", "74",
     "Zimmerer: Dachstuhl aufgerichtet, Windrispenbänder montiert.\nSanitär: Vorwände WC Kinder EG fertig."},
    {9, "14:00", "15:30", "heiter", "kein Niederschlag", "schwacher Wind aus West", "11", "60",
     "Erdbau: Schmutzwasserleitungen außen bis zum Revisionsschacht verlegt, Dichtheitsprüfung.",
     "Dichtheitsprüfung DN 150 (Haltungen S1–S4) mit Wasser nach DIN EN 1610, 30 min: bestanden."},
    {10, "07:30", "10:00", "bedeckt", "Nieselregen", "schwacher Wind aus Südwest", "6", "90",
     "Dachdecker: Unterdeckbahn und Konterlattung Süddach, Nordseite begonnen.\n"
     "Elektro und Sanitär: Durchbrüche OG nach revidierter Planung."},
    {11, "08:00", "10:30", "heiter", "kein Niederschlag", "schwacher Wind aus Ost", "2", "70",
     "Baustellenbegehung mit dem Bauherrn.\nDachdecker: Traufe Nordseite angeschlossen.\n"
     "Rohbau: Abplatzung Ringbalken Achse 4 instand gesetzt.",
     "", "", "Nächste Baubesprechung am Donnerstag, 19.03., um 10:00 Uhr im Baucontainer."},
};

// clang-format off
// Workforce of a company on one report, with the time recording behind its figures.
struct Shift
{
    int count;
    const char *type, *from, *to;
    int breaks; // minutes
};

struct Crew
{
    int report;
    const char *company, *comment;
    std::vector<Shift> shifts;
};

const std::vector<Crew> kCrews = {
    {0, "rohbau", "Mauerwerk OG", {{1, "Polier", "07:00", "16:30", 60}, {4, "Maurer", "07:00", "16:30", 60}}},
    {0, "elektro", "Schlitze, Leerrohre EG", {{2, "Elektroinstallateur", "07:00", "15:30", 30}}},
    {1, "rohbau", "Schalung, Mauerwerk",
     {{1, "Polier", "07:00", "16:30", 60}, {4, "Maurer", "07:00", "16:30", 60}}},
    {1, "sanitaer", "Vorwandinstallation EG", {{2, "Anlagenmechaniker", "07:30", "16:00", 30}}},
    {2, "rohbau", "Ringbalken OG",
     {{1, "Polier", "07:00", "17:00", 60}, {4, "Betonbauer", "07:00", "17:00", 60}}},
    {3, "beton", "Betonpumpe", {{1, "Maschinist", "13:15", "15:45", 0}}},
    {4, "rohbau", "Giebel", {{1, "Polier", "07:00", "16:30", 60}, {4, "Maurer", "07:00", "16:30", 60}}},
    {4, "elektro", "Rohinstallation EG",
     {{2, "Elektroinstallateur", "07:00", "15:30", 30}, {1, "Auszubildender", "07:00", "15:30", 30}}},
    {4, "sanitaer", "Vorwandinstallation EG", {{2, "Anlagenmechaniker", "07:30", "16:00", 30}}},
    {5, "rohbau", "Giebel", {{1, "Polier", "07:00", "16:30", 60}, {3, "Maurer", "07:00", "16:30", 60}}},
    {5, "geruest", "Gerüst, Dachfanggerüst", {{3, "Gerüstbauer", "07:00", "14:00", 30}}},
    {6, "zimmerer", "Dachstuhl",
     {{1, "Vorarbeiter", "07:00", "16:00", 45}, {4, "Zimmerer", "07:00", "16:00", 45}}},
    {6, "rohbau", "Restarbeiten Giebel", {{2, "Maurer", "07:00", "16:30", 60}}},
    {7, "zimmerer", "Dachstuhl, Sturmsicherung",
     {{1, "Vorarbeiter", "07:00", "16:00", 45}, {4, "Zimmerer", "07:00", "16:00", 45}}},
    {7, "elektro", "Rohinstallation OG", {{2, "Elektroinstallateur", "07:00", "15:30", 30}}},
    {8, "zimmerer", "Dachstuhl",
     {{1, "Vorarbeiter", "07:00", "16:00", 45}, {3, "Zimmerer", "07:00", "16:00", 45}}},
    {8, "sanitaer", "Vorwandinstallation EG", {{2, "Anlagenmechaniker", "07:30", "16:00", 30}}},
    {9, "erdbau", "Schmutzwasser außen",
     {{1, "Vorarbeiter", "07:00", "16:00", 45}, {2, "Tiefbauer", "07:00", "16:00", 45}}},
    {10, "zimmerer", "Dach",
     {{1, "Vorarbeiter", "07:00", "16:00", 45}, {3, "Dachdecker", "07:00", "16:00", 45}}},
    {10, "elektro", "Durchbrüche OG", {{2, "Elektroinstallateur", "07:00", "15:30", 30}}},
    {10, "sanitaer", "Durchbrüche OG", {{2, "Anlagenmechaniker", "07:30", "16:00", 30}}},
    {11, "zimmerer", "Dach Nordseite",
     {{1, "Vorarbeiter", "07:00", "16:00", 45}, {3, "Dachdecker", "07:00", "16:00", 45}}},
    {11, "rohbau", "Instandsetzung Ringbalken", {{2, "Maurer", "07:00", "12:00", 15}}},
};

// One row of a report's list; 'company' is a key of the master data.
struct Row
{
    int report;
    TN::TABLE_NAMES table;
    const char* company;
    Values values;
};

std::vector<Row> rows()
{
    return {
        {0, TN::TN_ATTENDEE, "bauleitung", {{"comment", "Baustellenrundgang"}}},
        {0, TN::TN_ATTENDEE, "rohbau", {{"comment", "Polier"}}},
        {1, TN::TN_ATTENDEE, "sigeko", {{"comment", "SiGe-Begehung"}}},
        {2, TN::TN_ATTENDEE, "tragwerk", {{"comment", "Bewehrungsabnahme"}}},
        {3, TN::TN_ATTENDEE, "rohbau", {{"comment", "Polier"}}},
        {4, TN::TN_ATTENDEE, "elektro", {{"comment", "Obermonteur"}}},
        {5, TN::TN_ATTENDEE, "sigeko", {{"comment", "Gerüstabnahme"}}},
        {6, TN::TN_ATTENDEE, "zimmerer", {{"comment", "Vorarbeiter"}}},
        {8, TN::TN_ATTENDEE, "architekt", {{"comment", "Baustellenbesuch"}}},
        {9, TN::TN_ATTENDEE, "tga", {{"comment", "Prüfung Entwässerung"}}},
        {11, TN::TN_ATTENDEE, "bauherr", {{"comment", "Baustellenbegehung"}}},
        {11, TN::TN_ATTENDEE, "architekt", {{"comment", "Baustellenbegehung"}}},

        {1, TN::TN_OBSTRUCTION, "rohbau", {{"description", "Nachtfrost bis −3 °C: Mauerarbeiten mit "
            "Dünnbettmörtel erst ab 10:00 Uhr möglich, Ausfall etwa 2,5 Stunden."}, {"date", day(1)}}},
        {7, TN::TN_OBSTRUCTION, "zimmerer", {{"description", "Sturmböen über 60 km/h: Kranarbeiten ab "
            "11:30 Uhr eingestellt, Dachstuhl verschiebt sich um einen halben Tag."}, {"date", day(8)}}},
        {5, TN::TN_DELAY, "zimmerer", {{"description", "Lieferung Konstruktionsvollholz drei Arbeitstage "
            "verspätet, Beginn Dachstuhl am 09.03. statt am 06.03."}, {"date", day(4)}}},
        {11, TN::TN_DELAY, "elektro", {{"description", "Unterverteilung UV-OG: Liefertermin vom Hersteller "
            "auf KW 14 verschoben."}, {"date", day(11)}}},
        {4, TN::TN_DEFICIENCY, "elektro", {{"description", "Leerrohre in der Innenwand zu flach verlegt, "
            "Überdeckung unter 1 cm."}, {"roomname", "Gruppenraum 2"}, {"roombook_number", "EG.04"},
            {"date", day(7)}}},
        {6, TN::TN_DEFICIENCY, "rohbau", {{"description", "Abplatzung an der Ringbalkenkante, etwa "
            "30 × 8 cm, Bewehrung sichtbar."}, {"roomname", "OG Außenwand Nord, Achse 4"},
            {"date", day(11)}}},
        {10, TN::TN_DEFICIENCY, "zimmerer", {{"description", "Unterdeckbahn nicht an das Traufblech "
            "angeschlossen, Wasser kann hinter die Rinne laufen."}, {"roomname", "Dach Nordseite, Traufe"},
            {"date", day(11)}}},
        {2, TN::TN_ACCEPTANCE, "tragwerk", {{"description", "Bewehrung Ringbalken OG Achsen A–E ohne "
            "Beanstandung."}, {"roomname", "OG"}}},
        {5, TN::TN_ACCEPTANCE, "geruest", {{"description", "Fassaden- und Dachfanggerüst, Prüfprotokoll "
            "liegt vor."}, {"roomname", "Fassade umlaufend"}}},
        {8, TN::TN_ACCEPTANCE, "elektro", {{"description", "Nachkontrolle Leerrohre: Mangel vom 05.03. "
            "beseitigt."}, {"roomname", "Gruppenraum 2"}, {"roombook_number", "EG.04"}}},
        {9, TN::TN_ACCEPTANCE, "erdbau", {{"description", "Schmutzwasserleitungen S1–S4 nach bestandener "
            "Dichtheitsprüfung."}, {"roomname", "Außenanlage Nord"}}},

        {1, TN::TN_DIRECTIVE, "rohbau", {{"description", "Frisches Mauerwerk über Nacht mit Folie und "
            "Dämmmatten gegen Frost schützen."}}},
        {4, TN::TN_DIRECTIVE, "elektro", {{"description", "Leerrohre Gruppenraum 2 tiefer setzen, vor dem "
            "Verputzen Kontrolle durch die Bauleitung."}}},
        {10, TN::TN_DIRECTIVE, "zimmerer", {{"description", "Anschluss Unterdeckbahn an das Traufblech "
            "Nordseite bis 13.03. herstellen."}}},
        {4, TN::TN_AUXILIARY_SERVICE, "rohbau", {{"description", "Kernbohrung DN 150 in der Außenwand für "
            "den Hausanschluss, 3 Stunden, Regiebericht Nr. 7."}}},
        {2, TN::TN_CONSTRUCTION_MEASURE, "tragwerk", {{"description", "Bewehrungsabnahme Ringbalken OG"},
            {"timefrom", at("07:30")}, {"timeto", at("08:30")}, {"location", "OG Achsen A–E"},
            {"kks", "RB-OG"}}},
        {3, TN::TN_CONSTRUCTION_MEASURE, "rohbau", {{"description", "Betonage Ringbalken OG"},
            {"timefrom", at("13:30")}, {"timeto", at("15:45")}, {"location", "OG Achsen A–E"},
            {"kks", "RB-OG"}}},

        {0, TN::TN_CONSTRUCTION_MATERIAL, "rohbau", {{"material", "Kalksandstein-Planelemente KS XL 17,5 cm"},
            {"quantity", 96.0}, {"unit", "m²"}, {"process", "Mauerwerk OG"}, {"material_temperature", 5},
            {"conditions", "trocken, abgedeckt gelagert"}, {"workflow", "Dünnbettmörtel, ab +5 °C"},
            {"note", "Lieferschein 44812"}}},
        {3, TN::TN_CONSTRUCTION_MATERIAL, "beton", {{"material", "Transportbeton C25/30 XC1 F3, 16 mm"},
            {"quantity", 12.5}, {"unit", "m³"}, {"process", "Betonage Ringbalken OG"},
            {"material_temperature", 14}, {"conditions", "Lufttemperatur 7 °C, kein Frost"},
            {"workflow", "Pumpe, Innenrüttler"},
            {"note", "Lieferscheine 118834 bis 118836, drei Probewürfel"}}},
        {6, TN::TN_CONSTRUCTION_MATERIAL, "zimmerer", {{"material", "Konstruktionsvollholz C24"},
            {"quantity", 14.2}, {"unit", "m³"}, {"process", "Dachstuhl"}, {"conditions", "trocken, gelagert"},
            {"workflow", "Abbund im Werk"}, {"note", "Holzfeuchte unter 15 %"}}},
        {2, TN::TN_SCHEDULED_DELIVERY, "rohbau", {{"deliverynumber", "TWP-112"}, {"deliveryindex", "C"},
            {"deliverydate", day(2)}, {"comment", "Bewehrungsplan Ringbalken OG"}}},
        {5, TN::TN_SCHEDULED_DELIVERY, "zimmerer", {{"deliverynumber", "A-DA-201"}, {"deliveryindex", "B"},
            {"deliverydate", day(4)}, {"comment", "Werkplanung Dachstuhl und Dachaufbau"}}},
        {8, TN::TN_SCHEDULED_DELIVERY, "bauherr", {{"deliverynumber", "A-FE-310"}, {"deliveryindex", "A"},
            {"deliverydate", day(9)}, {"comment", "Fensterliste mit Farbmustern zur Freigabe"}}},

        {0, TN::TN_TELEPHONE_NOTICE, "tga", {{"description", "Revidierte Durchbruchsplanung EG folgt bis "
            "Mittwoch."}, {"time", at("09:15")}}},
        {5, TN::TN_TELEPHONE_NOTICE, "zimmerer", {{"description", "Holz kommt Montag um 7:00 Uhr, Autokran "
            "ist bestellt."}, {"time", at("11:40")}}},
        {10, TN::TN_CONCERN, "sanitaer", {{"description", "Bedenken gegen die Leitungsführung Heizung im "
            "Flur OG: Abstand zur Abhangdecke für Brandschutzmanschetten zu gering."}}},

        {0, TN::TN_EQUIPMENT, "rohbau", {{"equipment", "Turmdrehkran 81 K"},
            {"operating_zone", "Baufeld Nord"}, {"entry_time", at("07:00")}, {"exit_time", at("16:30")},
            {"downtime", 0}}},
        {3, TN::TN_EQUIPMENT, "beton", {{"equipment", "Autobetonpumpe 36 m"},
            {"operating_zone", "Zufahrt Süd"}, {"entry_time", at("13:15")}, {"exit_time", at("15:45")},
            {"downtime", 20},
            {"downtime_reasons", "Wartezeit auf das zweite Fahrmischerfahrzeug"}}},
        {7, TN::TN_EQUIPMENT, "zimmerer", {{"equipment", "Autokran 40 t"}, {"operating_zone", "Zufahrt Süd"},
            {"entry_time", at("07:00")}, {"exit_time", at("15:00")}, {"downtime", 210},
            {"downtime_reasons", "Sturmböen, Kranbetrieb unzulässig"}}},
        {9, TN::TN_EQUIPMENT, "erdbau", {{"equipment", "Minibagger 3 t"}, {"operating_zone", "Trasse Nord"},
            {"entry_time", at("07:00")}, {"exit_time", at("16:00")}, {"downtime", 0}}},
    };
}
// clang-format on

// ---- Photos, drawn here so that no picture file is needed ----

void background(QPainter& p, const QColor& top, const QColor& bottom)
{
    QLinearGradient gradient(0, 0, 0, 750);
    gradient.setColorAt(0, top);
    gradient.setColorAt(1, bottom);
    p.fillRect(0, 0, 1000, 750, gradient);
}

void drawShell(QPainter& p)
{
    background(p, QColor(150, 180, 210), QColor(220, 228, 235));
    p.fillRect(0, 600, 1000, 150, QColor(120, 100, 80));   // ground
    p.fillRect(120, 300, 640, 300, QColor(232, 230, 222)); // sand-lime masonry
    p.fillRect(120, 440, 640, 20, QColor(170, 170, 165));  // slab edge
    for (int x = 160; x < 700; x += 120) {
        p.fillRect(x, 340, 70, 80, QColor(60, 60, 65));
        p.fillRect(x, 490, 70, 90, QColor(60, 60, 65));
    }
    p.setPen(QPen(QColor(90, 90, 95), 4)); // scaffold
    for (int x = 100; x <= 780; x += 85)
        p.drawLine(x, 600, x, 280);
    for (int y = 300; y <= 600; y += 75)
        p.drawLine(100, y, 780, y);
    p.setPen(QPen(QColor(235, 190, 30), 12)); // tower crane
    p.drawLine(880, 600, 880, 90);
    p.drawLine(560, 100, 990, 100);
}

void drawBricks(QPainter& p)
{
    background(p, QColor(175, 195, 215), QColor(210, 215, 220));
    p.fillRect(0, 560, 1000, 190, QColor(110, 105, 95));
    for (int x = 80; x < 1000; x += 300) {
        p.fillRect(x - 10, 530, 260, 30, QColor(170, 130, 80)); // pallet
        for (int row = 0; row < 6; ++row)
            for (int col = 0; col < 4; ++col)
                p.fillRect(x + col * 60, 460 - row * 62, 56, 58, QColor(236, 234, 228));
        p.fillRect(x + 115, 150, 10, 380, QColor(40, 90, 170)); // strapping
    }
}

void drawRebar(QPainter& p)
{
    background(p, QColor(196, 160, 100), QColor(176, 138, 82)); // formwork
    p.setPen(QPen(QColor(105, 60, 40), 14, Qt::SolidLine, Qt::RoundCap));
    for (int y = 120; y <= 630; y += 170)
        p.drawLine(20, y, 980, y + 10);
    p.setPen(QPen(QColor(120, 70, 45), 8, Qt::SolidLine, Qt::RoundCap));
    for (int x = 60; x < 1000; x += 80)
        p.drawLine(x, 90, x + 6, 660);
}

void drawSpalling(QPainter& p)
{
    background(p, QColor(165, 165, 160), QColor(140, 140, 136)); // concrete
    p.fillRect(0, 0, 1000, 180, QColor(120, 150, 190));
    QPainterPath hole;
    hole.addPolygon(QPolygonF({{300, 180}, {720, 180}, {680, 260}, {540, 300}, {380, 270}}));
    p.fillPath(hole, QColor(105, 100, 92));
    p.setPen(QPen(QColor(140, 70, 40), 12, Qt::SolidLine, Qt::RoundCap));
    p.drawLine(330, 230, 690, 226);                      // exposed bar
    p.fillRect(250, 380, 520, 40, QColor(240, 200, 30)); // folding rule for scale
    for (int x = 250; x < 770; x += 52)
        p.fillRect(x, 380, 4, 18, Qt::black);
}

void drawRoof(QPainter& p)
{
    background(p, QColor(120, 160, 205), QColor(215, 225, 235));
    p.fillRect(80, 520, 840, 230, QColor(232, 230, 222));
    p.fillRect(80, 500, 840, 24, QColor(170, 170, 165)); // ring beam
    p.setPen(QPen(QColor(190, 140, 80), 14, Qt::SolidLine, Qt::FlatCap));
    for (int x = 120; x < 900; x += 95)
        p.drawLine(x - 80, 505, x + 10, 200); // rafters
    p.drawLine(40, 505, 960, 505);
    p.drawLine(120, 210, 900, 210); // ridge purlin
}

// Drawn at the size the application stores photos at by default.
QImage picture(void (*draw)(QPainter&))
{
    QImage image(1000, 750, QImage::Format_RGB32);
    QPainter p(&image);
    p.setRenderHint(QPainter::Antialiasing);
    draw(p);
    p.end();
    return image;
}

struct Photo
{
    int report;
    int registerNo; // 1 progress ... 5 materials
    void (*draw)(QPainter&);
    const char* caption;
    int deficiency; // row of the report's deficiency list the photo shows, -1 none
};

const Photo kPhotos[] = {
    {0, 1, drawShell, "Ansicht Süd: Mauerwerk OG Achsen A–C", -1},
    {0, 5, drawBricks, "Anlieferung Kalksandstein-Planelemente", -1},
    {2, 4, drawRebar, "Bewehrung Ringbalken OG vor der Abnahme", -1},
    {6, 2, drawSpalling, "Abplatzung Ringbalken Achse 4", 0},
    {8, 1, drawRoof, "Dachstuhl aufgerichtet, Blick von Nordwest", -1},
};

// ---- Building the diary ----

bool setFields(VDRSqlTableModel* model, int row, const Values& values)
{
    bool ok = true;
    for (const auto& value : values) {
        if (!model->setData(row, QString::fromUtf8(value.first), value.second)) {
            std::fprintf(stderr, "vdr_makedemo: %s.%s not set\n",
                         qPrintable(VDRSqlTableModel::sqlTableName(model->tableNameId())), value.first);
            ok = false;
        }
    }
    return ok;
}

int lastId(VDRSqlTableModel* model)
{
    return model->data(model->rowCount() - 1, QStringLiteral("id"), Qt::EditRole).toInt();
}

bool appendRow(VDRDocument& doc, int entryId, TN::TABLE_NAMES table)
{
    static const QHash<int, bool (VDRDocument::*)(int)> append = {
        {TN::TN_ATTENDEE, &VDRDocument::appendEntryAttendee},
        {TN::TN_DELAY, &VDRDocument::appendEntryDelay},
        {TN::TN_OBSTRUCTION, &VDRDocument::appendEntryObstruction},
        {TN::TN_DEFICIENCY, &VDRDocument::appendEntryDfcy},
        {TN::TN_ACCEPTANCE, &VDRDocument::appendEntryAcceptance},
        {TN::TN_DIRECTIVE, &VDRDocument::appendEntryDirective},
        {TN::TN_AUXILIARY_SERVICE, &VDRDocument::appendEntryAuxiliaryservice},
        {TN::TN_CONSTRUCTION_MEASURE, &VDRDocument::appendEntryConstructionmeasure},
        {TN::TN_CONSTRUCTION_MATERIAL, &VDRDocument::appendEntryConstructionmaterial},
        {TN::TN_SCHEDULED_DELIVERY, &VDRDocument::appendEntryScheduleddelivery},
        {TN::TN_TELEPHONE_NOTICE, &VDRDocument::appendEntryTelephoneNotice},
        {TN::TN_CONCERN, &VDRDocument::appendEntryConcern},
        {TN::TN_EQUIPMENT, &VDRDocument::appendEntryEquipment},
    };
    const auto function = append.value(table, nullptr);
    return function && (doc.*function)(entryId);
}

bool fillDiary(VDRDocument& doc)
{
    bool ok = true;
    QHash<QString, int> companyIds;
    const auto fillList = [&](VDRSqlTableModel* model, const Company* begin, const Company* end, bool list1) {
        model->fetch_all();
        for (const Company* c = begin; c != end; ++c) {
            const int row = int(c - begin);
            if (row >= model->rowCount())
                ok &= list1 ? doc.appendCompany1(QString::fromUtf8(c->type)) : doc.appendCompany2();
            ok &= setFields(model, row,
                            {{"type", c->type},
                             {"firstname", c->firstname},
                             {"lastname", c->lastname},
                             {"company", c->company},
                             {"street", c->street},
                             {"plz", c->plz},
                             {"city", c->city},
                             {"telephone", c->telephone},
                             {"telefax", c->telefax},
                             {"mobile", c->mobile},
                             {"email", c->email}});
            companyIds.insert(QLatin1String(c->key),
                              model->data(row, QStringLiteral("id"), Qt::EditRole).toInt());
        }
        ok &= model->submitAll();
    };
    fillList(doc.modelCompany1(), std::begin(kPersons), std::end(kPersons), true);
    fillList(doc.modelCompany2(), std::begin(kCompanies), std::end(kCompanies), false);
    const auto company = [&](const char* key) {
        if (companyIds.contains(QLatin1String(key)))
            return QVariant(companyIds.value(QLatin1String(key)));
        std::fprintf(stderr, "vdr_makedemo: no company %s\n", key);
        ok = false;
        return QVariant();
    };

    VDRSqlTableModel* vdr = doc.modelVdr();
    ok &=
        setFields(vdr, 0,
                  {{"name", "Neubau Kita Sonnenblume"},
                   {"headline_left", "Neubau Kindertagesstätte „Sonnenblume“"},
                   {"headline_center", "Bautagebuch"},
                   {"headline_right", "Birkenweg 21, 21337 Lüneburg"},
                   {"footer_left", "Lindner + Kahl Architekten"},
                   {"footer_center", "Bauleitung: Katrin Vogt"},
                   {"footer_right", "Tel. 04131 24468-12"},
                   {"createdate", QDateTime(day(-7), at("08:00"))},
                   {"email_subject", "Bautagesbericht $Nummer vom $Datum – $Projektname"},
                   {"email_body", "Sehr geehrte Damen und Herren,\n\nanbei erhalten Sie den Bautagesbericht "
                                  "$Nummer vom $Datum.\n\nMit freundlichen Grüßen\nKatrin Vogt"},
                   {"projectnumber", "2025-117"},
                   {"projectaddress", "Birkenweg 21\n21337 Lüneburg"},
                   {"projectdescription", "Neubau einer viergruppigen Kindertagesstätte, zweigeschossiger "
                                          "Massivbau mit Satteldach, etwa 980 m² BGF."},
                   {"show_address1", 1},
                   {"address1", company("bauherr")},
                   {"show_address2", 1},
                   {"address2", company("architekt")}});
    for (const char* flag : {"show_projectname", "show_projectnumber", "show_headleft", "show_headcenter",
                             "show_headright", "show_footerleft", "show_footercenter", "show_footerright",
                             "show_projectaddress", "show_projectdescription"})
        ok &= setFields(vdr, 0, {{flag, 1}});
    ok &= vdr->submitAll();

    // The new diary's first report becomes the first visit; the others are created as the user would.
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    QList<int> entryIds;
    for (const Report& r : kReports) {
        if (!entryIds.isEmpty())
            ok &= doc.appendEntry() == 1;
        const int row = entries->rowCount() - 1;
        ok &= setFields(entries, row,
                        {{"inspection_date", day(r.day)},
                         {"inspection_time_from", at(r.from)},
                         {"inspection_time_to", at(r.to)},
                         {"env_time", at(r.from)},
                         {"env_weather1", r.clouds},
                         {"env_weather2", r.rain},
                         {"env_weather3", r.wind},
                         {"env_temperature", r.temperature},
                         {"env_humidity", r.humidity},
                         {"progress", r.progress},
                         {"tests", r.tests},
                         {"special_incidents", r.incidents},
                         {"notice", r.notice},
                         {"construction_material_sample", r.sample ? 1 : 0},
                         {"user_id", ""}});
        ok &= entries->submitAll();
        entryIds << lastId(entries);
        // The site manager is present at every visit.
        ok &= doc.appendEntryAttendee(entryIds.last());
        ok &= setFields(doc.modelEntryAttendee(entryIds.last()), 0, {{"company_id", company("bauleitung")}});
    }

    for (const Crew& crew : kCrews) {
        const int entryId = entryIds.at(crew.report);
        VDRSqlTableModel* workforce = doc.modelEntryWorkforce(entryId);
        VDRSqlTableModel* times = doc.modelEntryTimeRecording(entryId);
        ok &= doc.appendEntryWorkforce(entryId);
        const int workforceId = lastId(workforce);
        int persons = 0;
        double manHours = 0;
        QStringList types;
        for (const Shift& s : crew.shifts) {
            // Hours as the time recording computes them: persons × (time on site − breaks).
            const double hours = s.count * (at(s.from).secsTo(at(s.to)) / 3600.0 - s.breaks / 60.0);
            ok &= doc.appendEntryTimeRecording(entryId, workforceId);
            ok &= setFields(times, times->rowCount() - 1,
                            {{"person_count", s.count},
                             {"person_type", s.type},
                             {"time_from", at(s.from)},
                             {"time_to", at(s.to)},
                             {"breaks", s.breaks},
                             {"hours", hours}});
            persons += s.count;
            manHours += hours;
            if (!types.contains(QString::fromUtf8(s.type)))
                types << QString::fromUtf8(s.type);
        }
        ok &= setFields(workforce, workforce->rowCount() - 1,
                        {{"company_id", company(crew.company)},
                         {"comment", crew.comment},
                         {"person_count", persons},
                         {"person_type", types.join(QStringLiteral(", "))},
                         {"man_hours", manHours}});
    }

    for (const Row& r : rows()) {
        const int entryId = entryIds.at(r.report);
        VDRSqlTableModel* model = doc.modelEntry(entryId, r.table);
        ok &= appendRow(doc, entryId, r.table);
        const int row = model->rowCount() - 1;
        ok &= setFields(model, row, r.values);
        ok &= setFields(model, row, {{"company_id", company(r.company)}});
        if (r.table == TN::TN_EQUIPMENT) {
            // As the equipment editor stores it once both times are entered: whole minutes.
            const QTime in = model->data(row, QStringLiteral("entry_time"), Qt::EditRole).toTime();
            const QTime out = model->data(row, QStringLiteral("exit_time"), Qt::EditRole).toTime();
            ok &= setFields(model, row, {{"operating_time", (in.secsTo(out) + 86400) % 86400 / 60}});
        }
    }

    using AppendPhoto = bool (VDRDocument::*)(int, const QDate&, const QString&, int);
    const AppendPhoto appendPhoto[] = {&VDRDocument::appendEntryPhoto1, &VDRDocument::appendEntryPhoto2,
                                       &VDRDocument::appendEntryPhoto3, &VDRDocument::appendEntryPhoto4,
                                       &VDRDocument::appendEntryPhoto5};
    const TN::TABLE_NAMES photoTables[] = {TN::TN_PHOTO_PROGRESS, TN::TN_PHOTO_DEFICIENCY,
                                           TN::TN_PHOTO_OBSTRUCTION, TN::TN_PHOTO_MEASURE,
                                           TN::TN_PHOTO_MATERIAL};
    for (const Photo& photo : kPhotos) {
        const int entryId = entryIds.at(photo.report);
        const int imageId = doc.createImage(picture(photo.draw));
        ok &= imageId > 0 &&
              (doc.*appendPhoto[photo.registerNo - 1])(entryId, day(kReports[photo.report].day),
                                                       QString::fromUtf8(photo.caption), imageId);
        if (photo.deficiency < 0)
            continue;
        // A photo of a deficiency points at its row and carries its company, as the photo manager keeps them.
        VDRSqlTableModel* photos = doc.modelEntry(entryId, photoTables[photo.registerNo - 1]);
        VDRSqlTableModel* deficiencies = doc.modelEntryDfcy(entryId);
        const int d = photo.deficiency;
        ok &= setFields(photos, photos->rowCount() - 1,
                        {{"relation_id", deficiencies->data(d, QStringLiteral("id"), Qt::EditRole)},
                         {"company_id", deficiencies->data(d, QStringLiteral("company_id"), Qt::EditRole)}});
        const int count = deficiencies->data(d, QStringLiteral("image_cnt"), Qt::EditRole).toInt();
        ok &= setFields(deficiencies, d, {{"image_cnt", count + 1}});
    }

    for (const int entryId : qAsConst(entryIds)) {
        for (VDRSqlTableModel* model : doc.entryModels(entryId))
            ok &= model->submitAll();
    }
    // Locking freezes the companies a report names, as closing a report in the application does.
    for (int row = 0; row < kLockedReports; ++row)
        ok &= doc.lockEntry(row, true);
    ok &= doc.setMetaValue(QStringLiteral("isdp"), QStringLiteral("42"));
    return ok;
}

} // namespace

int main(int argc, char* argv[])
{
    QCoreApplication app(argc, argv);
    const QStringList args = app.arguments();
    if (args.size() != 2) {
        std::fprintf(stderr, "Aufruf: vdr_makedemo AUSGABE.vd2\n");
        return 1;
    }
    const QString target = QFileInfo(args.at(1)).absoluteFilePath();
    if (QFileInfo::exists(target)) {
        std::fprintf(stderr, "vdr_makedemo: %s existiert bereits.\n", qPrintable(target));
        return 1;
    }
    // The settings of whoever builds (the author code of new reports, say) must not reach the demo.
    QTemporaryDir settings;
    QSettings::setPath(QSettings::NativeFormat, QSettings::UserScope, settings.path());
    QSettings::setPath(QSettings::IniFormat, QSettings::UserScope, settings.path());

    VDRDocument doc;
    if (!doc.createDocument(true)) {
        std::fprintf(stderr, "vdr_makedemo: kein neues Dokument.\n");
        return 2;
    }
    // One transaction: otherwise every submit would be forced to disk on its own.
    doc.beginTransaction();
    bool ok = fillDiary(doc);
    doc.endTransaction();
    ok = ok && doc.writeWorkingCopyTo(target);
    doc.closeDocument();
    if (!ok) {
        std::fprintf(stderr, "vdr_makedemo: Das Musterprojekt konnte nicht erstellt werden.\n");
        return 2;
    }
    return 0;
}
