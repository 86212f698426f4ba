#include "editing/completion/CompleterEditor.h"

#include "document/VDRPrompt.h"
#include "editing/completion/CompleterDelegate.h"
#include "editing/completion/CompleterModel.h"
#include "editing/completion/CompleterStringListModel.h"
#include "editing/completion/VDRCompleter.h"

#include <QDateTime>
#include <QHBoxLayout>
#include <QHeaderView>
#include <QLabel>
#include <QListView>
#include <QPushButton>
#include <QSettings>
#include <QTableView>
#include <QVBoxLayout>

#include <algorithm>

namespace {
struct DefaultList
{
    VDRRegisterNames::RegisterNames regIdx;
    const char* title;
    const char* column;
    QStringList entries;
};

QList<DefaultList> defaultLists()
{
    using R = VDRRegisterNames;
    auto tr = [](const char* text) { return CompleterEditor::tr(text); };
    return {
        {R::Bautenstand,
         "Witterung Bewölkung",
         "",
         {tr("wolkenlos"), tr("heiter"), tr("wolkig"), tr("stark bewölkt"), tr("bedeckt")}},
        {R::Bautenstand,
         "Witterung Niederschlag",
         "",
         {tr("trocken"), tr("Niesel"), tr("Regen"), tr("Schauer"), tr("Hagel"), tr("Schnee"), tr("Gewitter"),
          tr("Nebel")}},
        {R::Bautenstand, "Witterung Wind", "", {tr("windstill"), tr("windig"), tr("böig"), tr("stürmisch")}},
        {R::Baustoffe,
         "Baustoffe",
         "Baustoff",
         {tr("Beispiel \"Beton\":"), tr("Zement, Zuschläge, Zusatzmittel, Zusatzstoffe"),
          tr("Baustellenbeton..., mit Zuschlag..., Zusätze..., Zementgehalt..."),
          tr("Transportbeton..., Betonsortenverzeichnis..., Fahrzeugvz..."),
          tr("Betonfertigteile..., Bauteil..., Bauabschnitt..."), tr("Betonstahl..., Sorte...")}},
        {R::Baustoffe, "Baustoffe", "Vorgang", {tr("geliefert"), tr("gelagert"), tr("eingebaut")}},
        {R::Baustoffe,
         "Baustoffe",
         "Memo",
         {tr("Lieferschein-Nr.:"), tr("Chargen-Nr.:"), tr("Lagerplatz:"), tr("Einbauort:")}},
        {R::Baustoffe, "Baustoffe", "Einheit", {tr("m"), tr("m²"), tr("m³"), tr("kg"), tr("t")}},
        {R::Bauablauf,
         "Baumaßnahmen",
         "Beschreibung",
         {tr("Beispiel \"Beton\":"), tr("Beton einbringen, Betontemp., LuftTemp., Witterung..."),
          tr("Ausschal-Arbeiten..."), tr("Nachbehandlung, Methode, Dauer..."),
          tr("Betonprobekörper..., Bezeichnung..., Bauteil..., Prüfergebnis..."),
          tr("Frischbetonuntersuchung..., "), tr("Tragwerk-Eingriffe")}},
        {R::Anwesende,
         "Zeiterfassung",
         "Personen",
         {tr("Personen"), tr("Bauleiter"), tr("Polier/e"), tr("Vorarbeiter"), tr("Facharbeiter"),
          tr("Helfer")}},
        {R::Stoerungen,
         "Mängel",
         "Raumname",
         {tr("Büro"), tr("Küche"), tr("WC"), tr("Flur"), tr("Treppenhaus"), tr("Zimmer")}},
        {R::Stoerungen, "Mängel", "Raumbuch-Nr.", {tr("UG-001"), tr("EG-001"), tr("OG-001"), tr("DG-001")}},
    };
}

void writeList(QSettings& settings, const QString& group, const QStringList& entries)
{
    settings.remove(group + QLatin1String("/values"));
    settings.beginWriteArray(group + QLatin1String("/values"), entries.size());
    for (int i = 0; i < entries.size(); ++i) {
        settings.setArrayIndex(i);
        settings.setValue(QStringLiteral("centry"), entries.at(i));
    }
    settings.endArray();
}
} // namespace

CompleterEditor::CompleterEditor(QWidget* parent)
    : QDialog(parent), m_model(new CompleterModel(this)), m_strings(new CompleterStringListModel(this)),
      m_table(new QTableView(this)), m_list(new QListView(this))
{
    setWindowTitle(tr("Autovervollständigen bearbeiten"));
    auto button = [this](const QString& text, const QString& toolTip, const char* name) {
        auto* b = new QPushButton(text, this);
        b->setToolTip(toolTip);
        b->setObjectName(QLatin1String(name));
        b->setAutoDefault(false);
        return b;
    };
    m_table->setObjectName(QStringLiteral("tableViewCompleters"));
    m_table->setModel(m_model);
    m_table->setSelectionBehavior(QAbstractItemView::SelectRows);
    m_table->setSelectionMode(QAbstractItemView::SingleSelection);
    m_table->horizontalHeader()->setSectionResizeMode(0, QHeaderView::Stretch);
    m_table->verticalHeader()->hide();
    m_list->setObjectName(QStringLiteral("listViewEntries"));
    m_list->setModel(m_strings);
    m_list->setItemDelegate(new CompleterDelegate(m_list));
    m_list->setEditTriggers(QAbstractItemView::DoubleClicked | QAbstractItemView::EditKeyPressed |
                            QAbstractItemView::SelectedClicked);

    auto* all = button(tr("Alle"), tr("Schaltet alle Completer ein"), "pushButtonAll");
    auto* none = button(tr("Keine"), tr("Schaltet alle Completer aus"), "pushButtonNone");
    auto* add = button(tr("Eintrag hinzufügen"), tr("Fügt dem aktuellen Completer einen Eintrag hinzu"),
                       "pushButtonAdd");
    auto* remove = button(tr("Eintrag löschen"), tr("Entfernt den selektierten Eintrag aus dem Completer"),
                          "pushButtonRemove");
    auto* removeAll = button(tr("Alles löschen"), tr("Löscht alle Einträge des aktuellen Completers"),
                             "pushButtonRemoveAll");
    auto* reset =
        button(tr("Zurücksetzen"), tr("Setzt alles auf den Auslieferzustand zurück"), "pushButtonReset");
    auto* ok = button(tr("OK"), QString(), "pushButtonOk");
    ok->setDefault(true);
    auto* cancel = button(tr("Abbrechen"), QString(), "pushButtonCancel");

    auto* left = new QVBoxLayout;
    left->addWidget(m_table);
    left->addWidget(new QLabel(tr("Textvorschläge aktivieren:"), this));
    auto* toggles = new QHBoxLayout;
    toggles->addWidget(all);
    toggles->addWidget(none);
    toggles->addStretch();
    left->addLayout(toggles);
    auto* right = new QVBoxLayout;
    right->addWidget(m_list);
    auto* entryButtons = new QHBoxLayout;
    entryButtons->addWidget(add);
    entryButtons->addWidget(remove);
    entryButtons->addWidget(removeAll);
    right->addLayout(entryButtons);
    auto* lists = new QHBoxLayout;
    lists->addLayout(left, 1);
    lists->addLayout(right, 1);
    auto* bottom = new QHBoxLayout;
    bottom->addWidget(reset);
    bottom->addStretch();
    bottom->addWidget(ok);
    bottom->addWidget(cancel);
    auto* layout = new QVBoxLayout(this);
    layout->addLayout(lists);
    layout->addLayout(bottom);
    resize(800, 500);

    connect(all, &QPushButton::clicked, this, [this] { m_model->toggleAllCompleters(true); });
    connect(none, &QPushButton::clicked, this, [this] { m_model->toggleAllCompleters(false); });
    connect(add, &QPushButton::clicked, this, &CompleterEditor::slotAddEntry);
    connect(remove, &QPushButton::clicked, this, &CompleterEditor::slotRemoveEntry);
    connect(removeAll, &QPushButton::clicked, this, &CompleterEditor::slotRemoveAll);
    connect(reset, &QPushButton::clicked, this, &CompleterEditor::slotReset);
    connect(ok, &QPushButton::clicked, this, &CompleterEditor::accept);
    connect(cancel, &QPushButton::clicked, this, &CompleterEditor::reject);
    connect(m_table->selectionModel(), &QItemSelectionModel::currentRowChanged, this,
            &CompleterEditor::slotCurrentRowChanged);
    initCompleters();
}

void CompleterEditor::resetToDefaults(bool onlyIfMissing)
{
    const QString group = VDRCompleter::settingsGroup();
    {
        QSettings settings;
        if (onlyIfMissing && settings.childGroups().contains(group))
            return;
        settings.remove(group);
    }
    for (const DefaultList& list : defaultLists())
        writeEntry(list.regIdx, QString::fromUtf8(list.title), QString::fromUtf8(list.column), list.entries);
    QSettings().setValue(group + QLatin1String("/init"), true);
}

void CompleterEditor::writeNewDocumentDefaults()
{
    const QString group = VDRCompleter::settingsGroup();
    QSettings settings;
    for (const DefaultList& list : defaultLists()) {
        const QString title = QString::fromUtf8(list.title);
        const QString column = QString::fromUtf8(list.column);
        const bool forDocument =
            (title == QLatin1String("Baustoffe") && column == QLatin1String("Einheit")) ||
            title == QStringLiteral("Mängel");
        if (forDocument &&
            !settings.contains(group + '/' + title + '/' + column + QLatin1String("/values/size")))
            writeEntry(list.regIdx, title, column, list.entries);
    }
}

void CompleterEditor::writeEntry(VDRRegisterNames::RegisterNames regIdx, const QString& title, QString column,
                                 const QStringList& entries)
{
    if (column.isEmpty())
        column = VDRCompleter::SimpleColumn;
    const QString group = VDRCompleter::settingsGroup() + '/' + title + '/' + column;
    QSettings settings;
    settings.setValue(group + QLatin1String("/enabled"), true);
    settings.setValue(group + QLatin1String("/regIdx"), int(regIdx));
    writeList(settings, group, entries);
}

bool CompleterEditor::editCompleters(QWidget* parent)
{
    VDRCompleter::writeAll();
    CompleterEditor editor(parent);
    const bool accepted = editor.exec() == QDialog::Accepted;
    // Also after cancelling: "Zurücksetzen" writes at once.
    VDRCompleter::updateAll();
    return accepted;
}

void CompleterEditor::initCompleters()
{
    QList<CompleterInfo> infos;
    QSettings settings;
    settings.beginGroup(VDRCompleter::settingsGroup());
    for (const QString& title : settings.childGroups()) {
        settings.beginGroup(title);
        for (const QString& column : settings.childGroups()) {
            settings.beginGroup(column);
            QStringList entries;
            const int count = settings.beginReadArray(QStringLiteral("values"));
            for (int i = 0; i < count; ++i) {
                settings.setArrayIndex(i);
                entries << settings.value(QStringLiteral("centry")).toString();
            }
            settings.endArray();
            const auto regIdx =
                VDRRegisterNames::RegisterNames(settings.value(QStringLiteral("regIdx")).toInt());
            infos << CompleterInfo(regIdx, title, column, column == VDRCompleter::SimpleColumn,
                                   settings.value(QStringLiteral("enabled"), true).toBool(), entries);
            settings.endGroup();
        }
        settings.endGroup();
    }
    std::stable_sort(infos.begin(), infos.end(), [](const CompleterInfo& a, const CompleterInfo& b) {
        return a.registerIndex() < b.registerIndex();
    });
    m_currentRow = -1;
    m_strings->load(QStringList());
    m_model->setInfos(infos);
    if (!infos.isEmpty())
        m_table->setCurrentIndex(m_model->index(0, CompleterModel::FieldColumn));
}

void CompleterEditor::storeCurrent()
{
    if (m_currentRow < 0 || !m_strings->isModified())
        return;
    CompleterInfo info = m_model->info(m_currentRow);
    info.setStrings(m_strings->stringList());
    m_model->replaceInfo(m_currentRow, info);
    m_strings->load(info.strings());
}

void CompleterEditor::slotCurrentRowChanged(const QModelIndex& current, const QModelIndex&)
{
    storeCurrent();
    m_currentRow = current.isValid() ? current.row() : -1;
    m_strings->load(m_model->info(m_currentRow).strings());
}

void CompleterEditor::slotAddEntry()
{
    if (m_currentRow < 0)
        return;
    m_strings->insertRows(0, 1);
    const QModelIndex index = m_strings->index(0);
    m_list->setCurrentIndex(index);
    m_list->edit(index);
}

void CompleterEditor::slotRemoveEntry()
{
    const QModelIndex index = m_list->currentIndex();
    if (index.isValid())
        m_strings->removeRows(index.row(), 1);
}

void CompleterEditor::slotRemoveAll()
{
    if (m_strings->rowCount() > 0)
        m_strings->removeRows(0, m_strings->rowCount());
}

void CompleterEditor::slotReset()
{
    resetToDefaults(false);
    VDRCompleter::updateAll();
    initCompleters();
}

bool CompleterEditor::allowClose()
{
    if (!m_model->isModified() && !m_strings->isModified())
        return true;
    return VDRPrompt::instance()->question(
               VDRPrompt::Question, tr("Autovervollständigen bearbeiten"),
               tr("Die Änderungen wurden nicht gespeichert.\nSollen sie verworfen werden?"),
               VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::No, VDRPrompt::No) == VDRPrompt::Yes;
}

void CompleterEditor::accept()
{
    // A row still being edited belongs to the result.
    if (QWidget* editor = m_list->indexWidget(m_list->currentIndex()))
        m_list->itemDelegate()->setModelData(editor, m_strings, m_list->currentIndex());
    storeCurrent();
    const QString stamp = QDateTime::currentDateTime().toString(Qt::TextDate);
    QSettings settings;
    for (const CompleterInfo& info : m_model->infos()) {
        if (!info.isModified())
            continue;
        const QString group = VDRCompleter::settingsGroup() + '/' + info.title() + '/' + info.column();
        QStringList entries;
        for (const QString& entry : info.strings()) {
            if (!entry.trimmed().isEmpty() && !entries.contains(entry))
                entries << entry;
        }
        settings.setValue(group + QLatin1String("/enabled"), info.isEnabled());
        settings.setValue(group + QLatin1String("/updateTime"), stamp);
        writeList(settings, group, entries);
    }
    QDialog::accept();
}

void CompleterEditor::reject()
{
    if (allowClose())
        QDialog::reject();
}
