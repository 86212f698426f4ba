// The report form's layout: the description of its views and fields, and the widgets built from it.
#include "editing/form/VDREntryWidgetLayout.h"

#include "editing/form/VDREntryWidget.h"

#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRCompleterLineEdit.h"
#include "editing/completion/VDRCompleterTextEdit.h"
#include "editing/form/VDRRichTextEdit.h"
#include "editing/tables/VDRTableView.h"
#include "editing/time/VDRDateEdit.h"
#include "editing/time/VDRTimeEdit.h"
#include "editing/time/VDRTimeRecordingWidget.h"

#include <QCheckBox>
#include <QGridLayout>
#include <QHBoxLayout>
#include <QHeaderView>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QTabWidget>
#include <QVBoxLayout>

namespace VDREntryWidgetLayout {
namespace {
using TN = VDRSqlTableModel;
using CW = VDRTableView;
} // namespace

const QVector<ViewLayout>& viewLayouts()
{
    static const QVector<ViewLayout> layouts = {
        {"entrydataAttendees",
         TN::TN_ATTENDEE,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Anwesende \"Am Bau Beteiligte\""),
         {{"company_id", CW::CWT_PERCENT, 50}, {"comment", CW::CWT_PERCENT, 50}},
         &VDRDocument::appendEntryAttendee},
        {"entrydataWorkforce",
         TN::TN_WORKFORCE,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Am Bau präsente Firmen"),
         {{"company_id", CW::CWT_PERCENT, 30},
          {"comment", CW::CWT_PERCENT, 30},
          {"person_count", CW::CWT_PIXEL, 34},
          {"person_type", CW::CWT_PERCENT, 40},
          {"man_hours", CW::CWT_PIXEL, 70}},
         &VDRDocument::appendEntryWorkforce},
        {"entrydataDelay",
         TN::TN_DELAY,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Im Verzug befindliche Firmen"),
         {{"description", CW::CWT_PERCENT, 37},
          {"company_id", CW::CWT_PERCENT, 37},
          {"date", CW::CWT_PERCENT, 16}},
         &VDRDocument::appendEntryDelay},
        {"entrydataObstruction",
         TN::TN_OBSTRUCTION,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Von Behinderung betroffene Firmen"),
         {{"description", CW::CWT_PERCENT, 37},
          {"company_id", CW::CWT_PERCENT, 37},
          {"date", CW::CWT_PERCENT, 16}},
         &VDRDocument::appendEntryObstruction},
        {"entrydataDfcy",
         TN::TN_DEFICIENCY,
         QT_TRANSLATE_NOOP("VDREntryWidget", "firmenbezogene Mängel bei der Ausführung"),
         {{"roomname", CW::CWT_PERCENT, 15},
          {"roombook_number", CW::CWT_PERCENT, 15},
          {"description", CW::CWT_PERCENT, 40},
          {"company_id", CW::CWT_PERCENT, 30},
          {"date", CW::CWT_PIXEL, 70},
          {"image_cnt", CW::CWT_PIXEL, 40}},
         &VDRDocument::appendEntryDfcy},
        {"entrydataAcceptance",
         TN::TN_ACCEPTANCE,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Von Abnahme betroffene Firmen"),
         {{"description", CW::CWT_PERCENT, 50}, {"company_id", CW::CWT_PERCENT, 50}},
         &VDRDocument::appendEntryAcceptance},
        {"entrydataDirective",
         TN::TN_DIRECTIVE,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Weisung / Unterlassungs-Aufforderung"),
         {{"description", CW::CWT_PERCENT, 50}, {"company_id", CW::CWT_PERCENT, 50}},
         &VDRDocument::appendEntryDirective},
        {"entrydataAuxiliaryService",
         TN::TN_AUXILIARY_SERVICE,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Vergütungsvereinbarung"),
         {{"description", CW::CWT_PERCENT, 50}, {"company_id", CW::CWT_PERCENT, 50}},
         &VDRDocument::appendEntryAuxiliaryservice},
        {"entrydataConstructionMeasures",
         TN::TN_CONSTRUCTION_MEASURE,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Baumaßnahmen eingeben"),
         {{"description", CW::CWT_PERCENT, 18},
          {"timefrom", CW::CWT_PERCENT, 14},
          {"timeto", CW::CWT_PERCENT, 14},
          {"location", CW::CWT_PERCENT, 18},
          {"kks", CW::CWT_PERCENT, 18},
          {"company_id", CW::CWT_PERCENT, 18}},
         &VDRDocument::appendEntryConstructionmeasure},
        {"entrydataConstructionMaterial",
         TN::TN_CONSTRUCTION_MATERIAL,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Baustoffe hier eingeben"),
         {{"company_id", CW::CWT_PERCENT, 17},
          {"material", CW::CWT_PERCENT, 21},
          {"quantity", CW::CWT_PIXEL, 60},
          {"unit", CW::CWT_PIXEL, 60},
          {"process", CW::CWT_PERCENT, 12},
          {"note", CW::CWT_PERCENT, 14},
          {"material_temperature", CW::CWT_PIXEL, 35},
          {"conditions", CW::CWT_PERCENT, 12},
          {"workflow", CW::CWT_PERCENT, 12},
          {"document", CW::CWT_PERCENT, 12}},
         &VDRDocument::appendEntryConstructionmaterial},
        {"entrydataScheduledDelivery",
         TN::TN_SCHEDULED_DELIVERY,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Planlieferungen hier eingeben"),
         {{"deliverynumber", CW::CWT_PERCENT, 10},
          {"deliveryindex", CW::CWT_PERCENT, 10},
          {"deliverydate", CW::CWT_PERCENT, 20},
          {"company_id", CW::CWT_PERCENT, 20},
          {"comment", CW::CWT_PERCENT, 20},
          {"document", CW::CWT_PERCENT, 20}},
         &VDRDocument::appendEntryScheduleddelivery},
        {"entrydataTelephoneNotice",
         TN::TN_TELEPHONE_NOTICE,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Telefongespräche hier dokumentieren"),
         {{"description", CW::CWT_PERCENT, 42},
          {"company_id", CW::CWT_PERCENT, 42},
          {"time", CW::CWT_PERCENT, 16}},
         &VDRDocument::appendEntryTelephoneNotice},
        {"entrydataConcern",
         TN::TN_CONCERN,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Von Firmen angemeldete Bedenken"),
         {{"description", CW::CWT_PERCENT, 50}, {"company_id", CW::CWT_PERCENT, 50}},
         &VDRDocument::appendEntryConcern},
        {"entrydataEquipment",
         TN::TN_EQUIPMENT,
         QT_TRANSLATE_NOOP("VDREntryWidget", "Geräte und Maschinen hier eingeben"),
         {{"equipment", CW::CWT_PERCENT, 20},
          {"operating_zone", CW::CWT_PERCENT, 21},
          {"company_id", CW::CWT_PERCENT, 20},
          {"entry_time", CW::CWT_PIXEL, 55},
          {"exit_time", CW::CWT_PIXEL, 55},
          {"operating_time", CW::CWT_PIXEL, 65},
          {"downtime", CW::CWT_PIXEL, 65},
          {"downtime_reasons", CW::CWT_PERCENT, 22},
          {"comment", CW::CWT_PERCENT, 17}},
         &VDRDocument::appendEntryEquipment},
    };
    return layouts;
}

const RichTextField richTextFields[5] = {{"entrydataProgress", "progress", "Leistungsstand", 0},
                                         {"entrydataSpecialIncident", "special_incidents", "Vorkommnisse", 0},
                                         {"entrydataIntervention", "interventions", "Eingriffe", 3},
                                         {"entrydataTests", "tests", "Prüfungen", 4},
                                         {"entrydataNotice", "notice", "Notizen", 4}};

void moveDeficiencySections(VDRTableView* v)
{
    QHeaderView* header = v->horizontalHeader();
    VDRSqlTableModel* model = v->vdrModel();
    if (!model)
        return;
    const char* const order[] = {"description", "roomname", "roombook_number",
                                 "company_id",  "date",     "image_cnt"};
    int position = 4; // after the hidden id, entry_id, pos and type
    for (const char* name : order) {
        const int column = model->fieldIndex(QLatin1String(name));
        if (column >= 0 && header->visualIndex(column) != position)
            header->moveSection(header->visualIndex(column), position);
        ++position;
    }
}

} // namespace VDREntryWidgetLayout

using namespace VDREntryWidgetLayout;

namespace {
// A button whose function is not available yet: disabled, and its tool tip says so.
QPushButton* notYetAvailableButton(QWidget* parent, const char* objectName, const QString& text,
                                   const QString& tip)
{
    auto* b = new QPushButton(text, parent);
    b->setObjectName(QLatin1String(objectName));
    b->setEnabled(false);
    b->setProperty("notYetAvailable", true);
    b->setToolTip(VDREntryWidget::tr("%1 (noch nicht verfügbar)").arg(tip.isEmpty() ? text : tip));
    return b;
}
} // namespace

void VDREntryWidget::buildLayout()
{
    auto* outer = new QVBoxLayout(this);
    m_headLine = new QLabel(this);
    m_headLine->setObjectName(QStringLiteral("labelHeadLine"));
    m_headLine->setTextFormat(Qt::RichText);
    outer->addWidget(m_headLine);
    m_tabs = new QTabWidget(this);
    m_tabs->setObjectName(QStringLiteral("tabWidget"));
    outer->addWidget(m_tabs, 1);

    const auto& layouts = viewLayouts();
    for (const ViewLayout& setup : layouts) {
        auto* v = new VDRTableView(this);
        v->setObjectName(QLatin1String(setup.objectName));
        v->setToolTip(tr(setup.toolTip));
        v->setButtonAddVisible(true);
        v->setButtonDeleteVisible(true);
        v->setButtonBigviewVisible(true);
        v->setSortingEnabled(false);
        m_views.append(v);
        m_models.append(nullptr);
        const auto append = setup.append;
        connect(v, &VDRTableView::signalButtonAddClicked, this, [this, append] {
            if (m_document && m_entryId > 0 && !isLocked())
                (m_document->*append)(m_entryId);
        });
    }
    connect(view(QStringLiteral("entrydataWorkforce")), &VDRTableView::mouseClick4TimeRecording, this,
            [this](int, int workforceId, int) {
                if (m_document && m_entryId > 0 && !isLocked())
                    VDRTimeRecordingWidget::editWorkforceRow(m_document, m_entryId, workforceId, this);
            });

    for (int i = 0; i < 5; ++i) {
        m_rich[i] = new VDRRichTextEdit(this, m_checker);
        m_rich[i]->setObjectName(QLatin1String(richTextFields[i].objectName));
        m_rich[i]->setFieldNumber(i);
        m_rich[i]->setCompleter(new VDRCompleter(
            richTextFields[i].registerIndex, QString::fromUtf8(richTextFields[i].registerTitle),
            VDRSqlTableModel::TN_ENTRY, VDRCompleter::SimpleColumn, i, m_rich[i]->textEdit()));
        connect(m_rich[i], &VDRRichTextEdit::enlargeRequested, this, &VDREntryWidget::slotEnlarge);
    }
    auto weather = [this](int i, const char* name, const char* tip, const char* title) {
        auto* e = new VDRCompleterLineEdit(this);
        e->setObjectName(QLatin1String(name));
        e->setToolTip(tr(tip));
        e->setCompleterData(0, QString::fromUtf8(title), VDRSqlTableModel::TN_ENTRY,
                            VDRCompleter::SimpleColumn, i);
        e->createCompleter();
        m_weather[i] = e;
    };
    weather(0, "entrydataEnvWeather1", QT_TR_NOOP("Bewölkung"), "Witterung Bewölkung");
    weather(1, "entrydataEnvWeather2", QT_TR_NOOP("Niederschlag"), "Witterung Niederschlag");
    weather(2, "entrydataEnvWeather3", QT_TR_NOOP("Wind"), "Witterung Wind");

    auto named = [](QWidget* w, const char* name) {
        w->setObjectName(QLatin1String(name));
        return w;
    };
    m_date = new VDRDateEdit(this);
    named(m_date, "entrydataInspectionDate");
    m_timeFrom = new VDRTimeEdit(this);
    named(m_timeFrom, "entrydataInspectionTimeFrom");
    m_timeTo = new VDRTimeEdit(this);
    named(m_timeTo, "entrydataInspectionTimeTo");
    m_envTime = new VDRTimeEdit(this);
    named(m_envTime, "entrydataEnvTime");
    m_temperature = new QLineEdit(this);
    named(m_temperature, "entrydataEnvTemperature");
    m_humidity = new QLineEdit(this);
    named(m_humidity, "entrydataEnvHumidity");
    m_sample = new QCheckBox(tr("Probekörper hergestellt."), this);
    named(m_sample, "entrydataConstructionMaterialSample");
    m_printTelephone = new QCheckBox(tr("Drucken"), this);
    named(m_printTelephone, "entrydataPrintTelephoneNotice");
    m_printNotice = new QCheckBox(tr("Drucken"), this);
    named(m_printNotice, "entrydataPrintNotice");
    m_workforceCount = new QLabel(this);
    named(m_workforceCount, "labelWorkforceCount");

    int helpNumber = 0;
    auto newTab = [&](const char* name, const QString& title) {
        auto* page = new QWidget(m_tabs);
        page->setObjectName(QLatin1String(name));
        auto* layout = new QVBoxLayout(page);
        m_tabs->addTab(page, title);
        const int tab = ++helpNumber;
        auto* help = new QPushButton(tr("Hilfe"), page);
        help->setObjectName(QStringLiteral("pushButton_help%1").arg(tab));
        connect(help, &QPushButton::clicked, this, [this, tab] { emit doOpenHelp(tab); });
        auto* top = new QHBoxLayout;
        top->addStretch();
        top->addWidget(help);
        layout->addLayout(top);
        return layout;
    };
    // A label above a field, with buttons beside the label.
    auto section = [this](QVBoxLayout* layout, const QString& label, QWidget* field,
                          const QList<QWidget*>& buttons, int stretch) {
        auto* row = new QHBoxLayout;
        row->addWidget(new QLabel(label, this));
        row->addStretch();
        for (QWidget* b : buttons)
            row->addWidget(b);
        layout->addLayout(row);
        layout->addWidget(field, stretch);
    };
    auto printButton = [this](const char* name, const QString& tip) {
        return notYetAvailableButton(this, name, tr("Drucken"), tip);
    };
    auto photos = [this](const char* name, int group) {
        QPushButton* b = notYetAvailableButton(this, name, tr("Fotos"), QString());
        connect(b, &QPushButton::clicked, this, [this, group] {
            switch (group) {
            case 1:
                emit displayPhotos1(-1);
                break;
            case 2:
                emit displayPhotos2(-1);
                break;
            case 3:
                emit displayPhotos3(-1);
                break;
            case 4:
                emit displayPhotos4(-1);
                break;
            default:
                emit displayPhotos5(-1);
                break;
            }
        });
        return b;
    };

    // 1 Bautenstand
    QVBoxLayout* t = newTab("tabData1", tr("Bautenstand"));
    auto* head = new QGridLayout;
    head->addWidget(new QLabel(tr("Datum:"), this), 0, 0);
    head->addWidget(m_date, 0, 1);
    head->addWidget(new QLabel(tr("Uhrzeit von"), this), 0, 2);
    head->addWidget(m_timeFrom, 0, 3);
    head->addWidget(new QLabel(tr("bis"), this), 0, 4);
    head->addWidget(m_timeTo, 0, 5);
    head->addWidget(new QLabel(tr("Uhr"), this), 0, 6);
    head->addWidget(new QLabel(tr("Wetter:"), this), 1, 0);
    head->addWidget(m_weather[0], 1, 1);
    head->addWidget(new QLabel(tr("Niederschlag:"), this), 1, 2);
    head->addWidget(m_weather[1], 1, 3);
    head->addWidget(new QLabel(tr("Wind:"), this), 1, 4);
    head->addWidget(m_weather[2], 1, 5);
    head->addWidget(new QLabel(tr("Tagesdaten:"), this), 2, 0);
    auto* day = new QHBoxLayout;
    day->addWidget(new QLabel(tr("Temperatur:"), this));
    day->addWidget(m_temperature);
    day->addWidget(new QLabel(tr("°C"), this));
    day->addWidget(new QLabel(tr("Luftfeuchtigkeit:"), this));
    day->addWidget(m_humidity);
    day->addWidget(new QLabel(tr("%"), this));
    day->addWidget(new QLabel(tr("Messzeitpunkt:"), this));
    day->addWidget(m_envTime);
    day->addWidget(new QLabel(tr("Uhr"), this));
    head->addLayout(day, 2, 1, 1, 6);
    t->addLayout(head);
    section(t, tr("Abnahmen:"), view(QStringLiteral("entrydataAcceptance")), {}, 1);
    section(t, tr("Besondere Vorkommnisse:"), m_rich[1], {}, 1);
    m_audio = notYetAvailableButton(this, "pbAudio", tr("Diktat"), QString());
    section(t, tr("Leistungsstand:"), m_rich[0],
            {photos("pushButtonPhotos1", 1),
             notYetAvailableButton(this, "pushButtonSketch1", tr("Skizze"), QString()), m_audio},
            3);
    // 2 Anwesende
    t = newTab("tabData2", tr("Anwesende"));
    section(t, tr("Anwesende Personen:"), view(QStringLiteral("entrydataAttendees")), {}, 1);
    section(t, tr("Baustellenbesetzung:"), view(QStringLiteral("entrydataWorkforce")),
            {m_workforceCount, notYetAvailableButton(this, "pbPrintTimeRecording", tr("Drucken"),
                                                     tr("Baubesetzung Stundenlisten drucken"))},
            2);
    // 3 Störungen
    t = newTab("tabData3", tr("Störungen"));
    section(t, tr("Behinderungen:"), view(QStringLiteral("entrydataObstruction")),
            {photos("pushButtonPhotos3", 3),
             notYetAvailableButton(this, "pushButtonSketch3", tr("Skizze"), QString()),
             printButton("pbPrintObstructionList", tr("Behinderungen drucken"))},
            1);
    section(t, tr("Mängel:"), view(QStringLiteral("entrydataDfcy")),
            {photos("pushButtonPhotos2", 2),
             notYetAvailableButton(this, "pushButtonSketch2", tr("Skizze"), QString()),
             printButton("pbPrintDfcyList", tr("Mängelliste drucken"))},
            1);
    section(t, tr("Verzüge:"), view(QStringLiteral("entrydataDelay")),
            {printButton("pbPrintDelayList", tr("Verzüge drucken"))}, 1);
    // 4 Bauablauf
    t = newTab("tabData5", tr("Bauablauf"));
    section(t, tr("Wichtige Baumaßnahmen:"), view(QStringLiteral("entrydataConstructionMeasures")),
            {photos("pushButtonPhotos4", 4), printButton("pbPrintMeasureList", tr("Baumaßnahmen drucken"))},
            1);
    section(t, tr("Weisungen:"), view(QStringLiteral("entrydataDirective")),
            {printButton("pbPrintDirectiveList", tr("Weisungen drucken"))}, 1);
    section(t, tr("Eingriffe in Tragwerke:"), m_rich[2], {}, 1);
    // 5 Vermerke
    t = newTab("tabData4", tr("Vermerke"));
    section(t, tr("Bedenkenanmeldungen:"), view(QStringLiteral("entrydataConcern")), {}, 1);
    section(t, tr("Telefonnotizen:"), view(QStringLiteral("entrydataTelephoneNotice")), {m_printTelephone},
            1);
    section(t, tr("Zusatzaufträge:"), view(QStringLiteral("entrydataAuxiliaryService")),
            {printButton("pbPrintAuxiliaryServiceList", tr("Zusatzaufträge drucken"))}, 1);
    section(t, tr("Sonstige Notizen:"), m_rich[4], {m_printNotice}, 1);
    section(t, tr("Prüfungen / Messungen:"), m_rich[3], {}, 1);
    // 6 Baustoffe
    t = newTab("tabData6", tr("Baustoffe"));
    section(t, tr("Baustoffe:"), view(QStringLiteral("entrydataConstructionMaterial")),
            {photos("pushButtonPhotos5", 5), printButton("pbPrintMaterialList", tr("Baustoffe drucken"))}, 1);
    auto* sampleRow = new QHBoxLayout;
    sampleRow->addWidget(m_sample);
    auto* sampleText =
        new QLabel(tr("Bezeichnung, Datum,  Bauteil, Bauabschnitt,  Anforderungen und Datum der "
                      "Ergebnisse: <br>siehe Kopie anliegender Baustellennotiz (Original auf der "
                      "Baustelle)."),
                   this);
    sampleText->setWordWrap(true);
    sampleRow->addWidget(sampleText, 1);
    t->addLayout(sampleRow);
    // 7 Pläne und Dokumente
    t = newTab("tabData7", tr("Pläne und Dokumente"));
    section(t, tr("Übergabe von Plänen und Dokumenten:"), view(QStringLiteral("entrydataScheduledDelivery")),
            {printButton("pbPrintScheduledDeliveryList", tr("Pläne und Dokumente drucken"))}, 1);
    // 8 Geräte und Maschinen
    t = newTab("tabdata8", tr("Geräte und Maschinen"));
    section(t, tr("Geräte und Maschinen:"), view(QStringLiteral("entrydataEquipment")),
            {printButton("pbPrintEquipmentList", tr("Geräte und Maschinen drucken"))}, 1);

    auto* buttons = new QHBoxLayout;
    m_finish = new QPushButton(tr("Bericht abschließen"), this);
    named(m_finish, "pushButtonFinish");
    m_sync = notYetAvailableButton(this, "pbSynch", tr("Synchronisieren"), QString());
    m_save = new QPushButton(tr("Änderung speichern"), this);
    named(m_save, "pushButtonSave");
    m_revert = new QPushButton(tr("Verwerfen"), this);
    named(m_revert, "pushButtonRevert");
    buttons->addWidget(m_finish);
    buttons->addWidget(m_sync);
    buttons->addStretch();
    buttons->addWidget(m_save);
    buttons->addWidget(m_revert);
    outer->addLayout(buttons);
    connect(m_finish, &QPushButton::clicked, this, &VDREntryWidget::on_pushButtonFinish_clicked);
    connect(m_save, &QPushButton::clicked, this, &VDREntryWidget::actionSubmit);
    connect(m_revert, &QPushButton::clicked, this, &VDREntryWidget::on_pushButtonRevert_clicked);
}
