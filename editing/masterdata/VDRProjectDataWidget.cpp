#include "editing/masterdata/VDRProjectDataWidget.h"

#include "document/AllCompanyModel.h"
#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"
#include "editing/completion/VDRCompleterTextEdit.h"
#include "editing/tables/VDRTableView.h"

#include <QCheckBox>
#include <QComboBox>
#include <QFormLayout>
#include <QGridLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QHeaderView>
#include <QIcon>
#include <QLabel>
#include <QLineEdit>
#include <QMetaMethod>
#include <QPushButton>
#include <QSettings>
#include <QSqlRecord>
#include <QStyledItemDelegate>
#include <QTabWidget>
#include <QTableView>
#include <QTextEdit>
#include <QToolButton>
#include <QVBoxLayout>

#include <algorithm>

namespace {

const char* const showColumns[] = {"show_projectname", "show_headleft",     "show_headcenter",
                                   "show_headright",   "show_footerleft",   "show_footercenter",
                                   "show_footerright", "show_projectnumber"};
const char* const headlineColumns[] = {"headline_left", "headline_center", "headline_right"};
const char* const footerColumns[] = {"footer_left", "footer_center", "footer_right"};

// The company columns shown in the lists, with their declared sizes.
struct CompanyColumn
{
    const char* field;
    int length;
    int share; // percent of the width by default
};
const CompanyColumn companyColumns[] = {
    {"type", 64, 11},    {"firstname", 64, 9}, {"lastname", 64, 10}, {"company", 128, 14},
    {"street", 128, 11}, {"plz", 16, 5},       {"city", 64, 9},      {"telephone", 64, 8},
    {"telefax", 64, 7},  {"mobile", 64, 7},    {"email", 128, 9},
};

// Company cells are edited in place: a line edit bounded by the column's size; an empty text is
// stored as a blank because the columns are NOT NULL. Frozen copies of locked reports stay as
// they are.
class CompanyDelegate : public QStyledItemDelegate
{
public:
    using QStyledItemDelegate::QStyledItemDelegate;

    QWidget* createEditor(QWidget* parent, const QStyleOptionViewItem&,
                          const QModelIndex& index) const override
    {
        auto* model = qobject_cast<const VDRSqlTableModel*>(index.model());
        if (!model || model->data(index.row(), QStringLiteral("category"), Qt::EditRole).toInt() < 0)
            return nullptr;
        const QString field = model->record().fieldName(index.column());
        for (const CompanyColumn& column : companyColumns) {
            if (field == QLatin1String(column.field)) {
                auto* edit = new QLineEdit(parent);
                edit->setFrame(false);
                edit->setMaxLength(column.length);
                return edit;
            }
        }
        return nullptr;
    }

    void setEditorData(QWidget* editor, const QModelIndex& index) const override
    {
        // Empty cells hold a blank; the editor starts without it.
        if (auto* edit = qobject_cast<QLineEdit*>(editor))
            edit->setText(index.data(Qt::EditRole).toString().trimmed());
    }

    void setModelData(QWidget* editor, QAbstractItemModel* model, const QModelIndex& index) const override
    {
        auto* edit = qobject_cast<QLineEdit*>(editor);
        if (!edit)
            return;
        QString text = edit->text().simplified();
        model->setData(index, text.isEmpty() ? QStringLiteral(" ") : text);
    }
};

QStringList fieldChoices()
{
    return {VDRProjectDataWidget::tr("- leer -"), VDRProjectDataWidget::tr("Typ"),
            VDRProjectDataWidget::tr("Vorname"),  VDRProjectDataWidget::tr("Nachname"),
            VDRProjectDataWidget::tr("Firma"),    VDRProjectDataWidget::tr("Straße"),
            VDRProjectDataWidget::tr("PLZ"),      VDRProjectDataWidget::tr("Ort"),
            VDRProjectDataWidget::tr("Telefon"),  VDRProjectDataWidget::tr("Telefax"),
            VDRProjectDataWidget::tr("Mobil"),    VDRProjectDataWidget::tr("E-Mail")};
}

QString nonNull(const QString& text)
{
    // A null string would be bound as NULL.
    return text.isNull() ? QStringLiteral("") : text;
}

QStringList widthsOf(const QTableView* view)
{
    QStringList widths;
    for (int c = 0; c < view->horizontalHeader()->count(); ++c)
        widths << QString::number(view->horizontalHeader()->sectionSize(c));
    return widths;
}

} // namespace

VDRProjectDataWidget::VDRProjectDataWidget(QWidget* parent, VDRSpellChecker* checker)
    : QDialog(parent), m_checker(checker)
{
    setObjectName(QStringLiteral("VDRProjectDataWidget"));
    setWindowTitle(tr("Projektdaten"));
    m_tabs = new QTabWidget(this);
    m_tabs->setObjectName(QStringLiteral("tabWidget"));
    m_tabs->addTab(createProjectTab(), tr("Projektdaten"));
    m_tabs->addTab(createCompanyTab(), tr("Firmenliste"));
    m_tabs->addTab(createFormatTab(), tr("Firmendaten Ausgabeformat"));

    m_print = new QPushButton(tr("Drucken"), this);
    m_print->setObjectName(QStringLiteral("pbPrint"));
    m_import = new QPushButton(tr("Firmen importieren"), this);
    m_import->setObjectName(QStringLiteral("pbImport"));
    auto* ok = new QPushButton(tr("OK"), this);
    ok->setObjectName(QStringLiteral("pbOk"));
    ok->setDefault(true);
    auto* cancel = new QPushButton(tr("Abbrechen"), this);
    cancel->setObjectName(QStringLiteral("pbCancel"));
    connect(m_print, &QPushButton::clicked, this, &VDRProjectDataWidget::sl_printProjectData);
    connect(m_import, &QPushButton::clicked, this, &VDRProjectDataWidget::sl_importCompanyData);
    connect(ok, &QPushButton::clicked, this, &VDRProjectDataWidget::accept);
    connect(cancel, &QPushButton::clicked, this, &VDRProjectDataWidget::reject);

    auto* buttons = new QHBoxLayout;
    buttons->addWidget(m_print);
    buttons->addWidget(m_import);
    buttons->addStretch();
    buttons->addWidget(ok);
    buttons->addWidget(cancel);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(m_tabs);
    layout->addLayout(buttons);
    resize(900, 640);
}

VDRProjectDataWidget::~VDRProjectDataWidget() = default;

QWidget* VDRProjectDataWidget::createProjectTab()
{
    auto* tab = new QWidget(this);
    auto* layout = new QVBoxLayout(tab);
    auto lineEdit = [&](const char* name) {
        auto* edit = new QLineEdit(tab);
        edit->setObjectName(QLatin1String(name));
        return edit;
    };

    auto* form = new QFormLayout;
    m_name = lineEdit("lineEditProjectname");
    m_number = lineEdit("lineEditProjectNumber");
    form->addRow(tr("Projektname:"), m_name);
    form->addRow(tr("Projektnummer:"), m_number);
    layout->addLayout(form);

    auto* texts = new QGridLayout;
    const char* headNames[] = {"lineEditHeadlineLeft", "lineEditHeadlineCenter", "lineEditHeadlineRight"};
    const char* footNames[] = {"lineEditFooterLeft", "lineEditFooterCenter", "lineEditFooterRight"};
    const QString positions[] = {tr("Links:"), tr("Mitte:"), tr("Rechts:")};
    texts->addWidget(new QLabel(tr("Kopfzeile:"), tab), 0, 0);
    texts->addWidget(new QLabel(tr("Fußzeile:"), tab), 1, 0);
    for (int i = 0; i < 3; ++i) {
        m_headline[i] = lineEdit(headNames[i]);
        m_footer[i] = lineEdit(footNames[i]);
        texts->addWidget(new QLabel(positions[i], tab), 0, 1 + 2 * i);
        texts->addWidget(m_headline[i], 0, 2 + 2 * i);
        texts->addWidget(new QLabel(positions[i], tab), 1, 1 + 2 * i);
        texts->addWidget(m_footer[i], 1, 2 + 2 * i);
    }
    layout->addLayout(texts);

    m_emptyCategories =
        new QCheckBox(tr("Leere Kategorien (Anwesende Personen, Tagesdaten, etc...) im Ausdruck "
                         "und in der PDF-Ausgabe anzeigen."),
                      tab);
    m_emptyCategories->setObjectName(QStringLiteral("checkBoxEmptyCategories"));
    layout->addWidget(m_emptyCategories);

    auto* sheet = new QGroupBox(tr("Daten für Projektdatenblatt wählen"), tab);
    auto* sheetLayout = new QGridLayout(sheet);
    const char* flagNames[] = {"cb_projectname", "cb_headleft",   "cb_headcenter", "cb_headright",
                               "cb_footleft",    "cb_footcenter", "cb_footright",  "cb_projectnumber"};
    const QString flagTexts[] = {tr("Projektname"),      tr("Kopfzeile links"), tr("Kopfzeile mitte"),
                                 tr("Kopfzeile rechts"), tr("Fußzeile links"),  tr("Fußzeile mitte"),
                                 tr("Fußzeile rechts"),  tr("Projektnummer")};
    for (int i = 0; i < 8; ++i) {
        auto* box = new QCheckBox(flagTexts[i], sheet);
        box->setObjectName(QLatin1String(flagNames[i]));
        m_showFlags << box;
    }
    // Name and number first, then the header and footer fields in their rows.
    sheetLayout->addWidget(m_showFlags[0], 0, 0);
    sheetLayout->addWidget(m_showFlags[7], 0, 1);
    for (int i = 0; i < 3; ++i) {
        sheetLayout->addWidget(m_showFlags[1 + i], 1, i);
        sheetLayout->addWidget(m_showFlags[4 + i], 2, i);
    }
    auto* cbAddress = new QCheckBox(tr("Projektanschrift"), sheet);
    cbAddress->setObjectName(QStringLiteral("cb_projectaddress"));
    m_projectAddress = new QTextEdit(sheet);
    m_projectAddress->setObjectName(QStringLiteral("te_projectaddress"));
    m_projectAddress->setAcceptRichText(false);
    auto* cbDescription = new QCheckBox(tr("Projektbeschreibung"), sheet);
    cbDescription->setObjectName(QStringLiteral("cb_projectdescription"));
    m_projectDescription = new VDRCompleterTextEdit(sheet, m_checker);
    m_projectDescription->setObjectName(QStringLiteral("te_projectdescription"));
    m_projectDescription->enableCompleter(false);
    m_showFlags << cbAddress << cbDescription;
    sheetLayout->addWidget(cbAddress, 3, 0);
    sheetLayout->addWidget(m_projectAddress, 4, 0, 1, 3);
    sheetLayout->addWidget(cbDescription, 5, 0);
    sheetLayout->addWidget(m_projectDescription, 6, 0, 1, 3);
    layout->addWidget(sheet);

    auto* parties = new QGroupBox(tr("Projektbeteiligte"), tab);
    auto* partyLayout = new QGridLayout(parties);
    for (int i = 0; i < 3; ++i) {
        m_showAddress[i] = new QCheckBox(tr("Adresse %1").arg(i + 1), parties);
        m_showAddress[i]->setObjectName(QStringLiteral("cb_address%1").arg(i + 1));
        m_address[i] = new QComboBox(parties);
        m_address[i]->setObjectName(QStringLiteral("combo_address%1").arg(i + 1));
        m_address[i]->setSizeAdjustPolicy(QComboBox::AdjustToMinimumContentsLengthWithIcon);
        m_address[i]->setMinimumContentsLength(30);
        partyLayout->addWidget(m_showAddress[i], i, 0);
        partyLayout->addWidget(m_address[i], i, 1);
    }
    partyLayout->setColumnStretch(1, 1);
    layout->addWidget(parties);
    return tab;
}

QWidget* VDRProjectDataWidget::createCompanyTab()
{
    auto* tab = new QWidget(this);
    auto* layout = new QVBoxLayout(tab);
    auto makeList = [&](const QString& title, const char* name, VDRTableView*& view) {
        auto* group = new QGroupBox(title, tab);
        auto* groupLayout = new QHBoxLayout(group);
        view = new VDRTableView(group);
        view->setObjectName(QLatin1String(name));
        view->setButtonBigviewVisible(false);
        groupLayout->addWidget(view);
        layout->addWidget(group);
    };
    makeList(tr("Am Bau beteiligte Personen"), "tableViewCompanies1", m_table1);
    makeList(tr("Gewerke/Baufirmen"), "tableViewCompanies2", m_table2);
    connect(m_table1, &VDRTableView::signalButtonAddClicked, this, &VDRProjectDataWidget::slotAddCompany1);
    connect(m_table2, &VDRTableView::signalButtonAddClicked, this, &VDRProjectDataWidget::slotAddCompany2);
    // List 1 asks here before removing; list 2 uses the table's own removal, which asks the same.
    m_table1->setFlagAutodelete(false);
    m_table2->setFlagAutodelete(true);
    connect(m_table1, &VDRTableView::signalButtonDeleteClicked, this,
            &VDRProjectDataWidget::slotRemoveCompany1);
    connect(m_table2, &VDRTableView::signalButtonDeleteClicked, this,
            &VDRProjectDataWidget::slotRemoveCompany2);
    return tab;
}

QWidget* VDRProjectDataWidget::createFormatTab()
{
    auto* tab = new QWidget(this);
    auto* layout = new QVBoxLayout(tab);
    const QStringList choices = fieldChoices();
    const QString bracketText = tr("Dieses Feld in Klammern setzen");

    auto makeGroup = [&](const QString& title, int fields, QComboBox** combos, QCheckBox** brackets,
                         QLineEdit*& example, const char* resetName, const QString& formatName) {
        auto* group = new QGroupBox(title, tab);
        auto* grid = new QGridLayout(group);
        for (int i = 0; i < fields; ++i) {
            combos[i] = new QComboBox(group);
            combos[i]->setObjectName(QStringLiteral("cbFormat%1Field%2").arg(formatName).arg(i + 1));
            combos[i]->addItems(choices);
            if (i == fields - 1)
                combos[i]->setToolTip(
                    tr("Wählen Sie Feld %1 des %2 Formats.\nDieses Feld wird in Klammern "
                       "ausgegeben.\nWählen Sie '- leer -', um dieses Feld nicht auszugeben.")
                        .arg(i + 1)
                        .arg(formatName == QLatin1String("1") ? tr("firmenbezogenen")
                                                              : tr("personenbezogenen")));
            else
                combos[i]->setToolTip(
                    tr("Wählen Sie Feld %1 des %2 Formats.\n Wählen Sie '- leer -', um dieses "
                       "Feld nicht auszugeben.")
                        .arg(i + 1)
                        .arg(formatName == QLatin1String("1") ? tr("firmenbezogenen")
                                                              : tr("personenbezogenen")));
            grid->addWidget(new QLabel(tr("Text %1:").arg(i + 1), group), i, 0);
            grid->addWidget(combos[i], i, 1);
            if (i >= fields - 2) {
                QCheckBox*& box = brackets[i - (fields - 2)];
                box = new QCheckBox(bracketText, group);
                box->setObjectName(QStringLiteral("cbFormat%1Field%2InBrackets").arg(formatName).arg(i + 1));
                grid->addWidget(box, i, 2);
            }
        }
        example = new QLineEdit(group);
        example->setObjectName(QStringLiteral("lineEditFormat%1Example").arg(formatName));
        example->setReadOnly(true);
        grid->addWidget(new QLabel(tr("Beispiel:"), group), fields, 0);
        grid->addWidget(example, fields, 1, 1, 2);
        auto* reset = new QPushButton(tr("Auf Werkseinstellungen zurücksetzen"), group);
        reset->setObjectName(QLatin1String(resetName));
        grid->addWidget(reset, fields + 1, 1);
        grid->setColumnStretch(1, 1);
        layout->addWidget(group);
        return reset;
    };
    QPushButton* reset1 = makeGroup(tr("Firmenbezogenes Ausgabeformat"), 3, m_format1Field, m_format1Brackets,
                                    m_format1Example, "pbFormat1Defaults", QStringLiteral("1"));
    QPushButton* reset2 =
        makeGroup(tr("Personenbezogenes Ausgabeformat"), 4, m_format2Field, m_format2Brackets,
                  m_format2Example, "pbFormat2Defaults", QStringLiteral("2"));
    layout->addStretch();

    using Self = VDRProjectDataWidget;
    auto activated = QOverload<int>::of(&QComboBox::currentIndexChanged);
    connect(m_format1Field[0], activated, this, &Self::slot_updateCompanyOutputFormat1FieldIdx1);
    connect(m_format1Field[1], activated, this, &Self::slot_updateCompanyOutputFormat1FieldIdx2);
    connect(m_format1Field[2], activated, this, &Self::slot_updateCompanyOutputFormat1FieldIdx3);
    connect(m_format1Brackets[0], &QCheckBox::toggled, this,
            &Self::slot_updateCompanyOutputFormat1Field2InBrackets);
    connect(m_format1Brackets[1], &QCheckBox::toggled, this,
            &Self::slot_updateCompanyOutputFormat1Field3InBrackets);
    connect(m_format2Field[0], activated, this, &Self::slot_updateCompanyOutputFormat2FieldIdx1);
    connect(m_format2Field[1], activated, this, &Self::slot_updateCompanyOutputFormat2FieldIdx2);
    connect(m_format2Field[2], activated, this, &Self::slot_updateCompanyOutputFormat2FieldIdx3);
    connect(m_format2Field[3], activated, this, &Self::slot_updateCompanyOutputFormat2FieldIdx4);
    connect(m_format2Brackets[0], &QCheckBox::toggled, this,
            &Self::slot_updateCompanyOutputFormat2Field3InBrackets);
    connect(m_format2Brackets[1], &QCheckBox::toggled, this,
            &Self::slot_updateCompanyOutputFormat2Field4InBrackets);
    connect(reset1, &QPushButton::clicked, this, &Self::on_pbFormat1Defaults_clicked);
    connect(reset2, &QPushButton::clicked, this, &Self::on_pbFormat2Defaults_clicked);
    return tab;
}

QMap<QString, QString> VDRProjectDataWidget::createExampleCompany()
{
    return {{QStringLiteral("type"), tr("Architekt")},
            {QStringLiteral("firstname"), QStringLiteral("Karl")},
            {QStringLiteral("lastname"), QStringLiteral("Mustermann")},
            {QStringLiteral("company"), QStringLiteral("Mustermann & Söhne")},
            {QStringLiteral("street"), QStringLiteral("Musterstraße. 99")},
            {QStringLiteral("plz"), QStringLiteral("12345")},
            {QStringLiteral("city"), QStringLiteral("Musterstadt")},
            {QStringLiteral("telephone"), QStringLiteral("Tel. 0123-45678")},
            {QStringLiteral("telefax"), QStringLiteral("Fax 0123-456789")},
            {QStringLiteral("mobile"), QStringLiteral("Mobil 0178-7654321")},
            {QStringLiteral("email"), QStringLiteral("karl@mustermann-soehne.de")}};
}

void VDRProjectDataWidget::activateTab(SettingsType type)
{
    const int tab = qBound(0, int(type), 2);
    m_tabs->setCurrentIndex(tab);
    setWindowIcon(QIcon(
        tab == 0 ? QStringLiteral(":/VDRMainWindow/Resources/4 Stammdaten/01-stammdaten-projektdaten.ico")
                 : QStringLiteral(":/VDRMainWindow/Resources/4 Stammdaten/02-stammdaten-firmenliste.ico")));
    setWindowTitle(m_tabs->tabText(tab));
}

void VDRProjectDataWidget::setPrintButtonVisible(bool visible)
{
    m_printWanted = visible;
}

void VDRProjectDataWidget::countCompanyEntries(int& persons, int& companies) const
{
    persons = companies = 0;
    if (!m_document || !m_document->modelCompany1())
        return;
    auto count = [](VDRSqlTableModel* model) {
        int n = 0;
        for (int row = 0; row < model->rowCount(); ++row) {
            // Rows removed but not yet submitted are marked "!".
            if (model->headerData(row, Qt::Vertical).toString() != QLatin1String("!"))
                n += model->data(row, QStringLiteral("category"), Qt::EditRole).toInt() > 0 ? 1 : 0;
        }
        return n;
    };
    persons = count(m_document->modelCompany1());
    companies = count(m_document->modelCompany2());
}

void VDRProjectDataWidget::slotDocumentOpened(VDRDocument* document)
{
    m_document = document;
    delete m_allCompanyModel;
    m_allCompanyModel = nullptr;
    if (!document || !document->modelVdr())
        return;
    m_allCompanyModel = new AllCompanyModel(this, document->database());
    for (QComboBox* combo : m_address)
        combo->setModel(m_allCompanyModel);
    setCompanyModels();
}

void VDRProjectDataWidget::slotDocumentClosed(VDRDocument* document)
{
    if (document != m_document)
        return;
    m_table1->setModel(nullptr);
    m_table2->setModel(nullptr);
    // The party choosers fall back to an empty model of their own when theirs goes.
    delete m_allCompanyModel;
    m_allCompanyModel = nullptr;
    m_document = nullptr;
}

void VDRProjectDataWidget::setCompanyModels()
{
    struct
    {
        VDRTableView* view;
        VDRSqlTableModel* model;
    } lists[] = {{m_table1, m_document->modelCompany1()}, {m_table2, m_document->modelCompany2()}};
    for (auto& list : lists) {
        VDRSqlTableModel* model = list.model;
        model->fetch_all();
        list.view->setModel(model);
        // Company cells are edited in place here, unlike in the report tables.
        QAbstractItemDelegate* old = list.view->itemDelegate();
        list.view->setItemDelegate(new CompanyDelegate(list.view));
        if (old && old->parent() == list.view)
            old->deleteLater();
        for (int c = 0; c < model->columnCount(); ++c)
            list.view->setColumnHidden(c, true);
        for (const CompanyColumn& column : companyColumns)
            list.view->setColumnHidden(model->fieldIndex(QLatin1String(column.field)), false);
        // The lists are shown in their stored order.
        list.view->horizontalHeader()->setSectionsMovable(false);
    }
}

void VDRProjectDataWidget::showEvent(QShowEvent* event)
{
    if (m_document) {
        // Imports and synchronisation write with SQL; the dialog starts from what the diary holds.
        for (VDRSqlTableModel* model :
             {m_document->modelVdr(), m_document->modelCompany1(), m_document->modelCompany2()}) {
            if (!model->isDirty()) {
                model->select();
                model->fetch_all();
            }
        }
        updateAllCompanyModel();
        readVdrRow();
    }
    restoreCompanyOutputFormat1Settings();
    restoreCompanyOutputFormat2Settings();
    restoreCompanyColumnWidths();
    showAllRows();
    // Printing and importing are done by whoever listens; without a listener the buttons would do nothing.
    m_print->setVisible(m_printWanted && isSignalConnected(QMetaMethod::fromSignal(
                                             &VDRProjectDataWidget::printProjectDataRequested)));
    m_import->setVisible(
        isSignalConnected(QMetaMethod::fromSignal(&VDRProjectDataWidget::importCompanyDataRequested)));
    QDialog::showEvent(event);
}

void VDRProjectDataWidget::updateAllCompanyModel()
{
    if (!m_allCompanyModel)
        return;
    int ids[3];
    for (int i = 0; i < 3; ++i)
        ids[i] = m_allCompanyModel->getIdForIndex(m_address[i]->currentIndex());
    m_allCompanyModel->refresh();
    for (int i = 0; i < 3; ++i)
        m_address[i]->setCurrentIndex(m_allCompanyModel->getIndexForId(ids[i]));
}

void VDRProjectDataWidget::readVdrRow()
{
    VDRSqlTableModel* vdr = m_document->modelVdr();
    if (vdr->rowCount() == 0)
        return;
    auto text = [&](const QString& field) { return vdr->data(0, field, Qt::EditRole).toString(); };
    auto flag = [&](const QString& field) { return vdr->data(0, field, Qt::EditRole).toInt() != 0; };
    m_name->setText(text("name"));
    m_number->setText(text("projectnumber"));
    for (int i = 0; i < 3; ++i) {
        m_headline[i]->setText(text(QLatin1String(headlineColumns[i])));
        m_footer[i]->setText(text(QLatin1String(footerColumns[i])));
    }
    m_emptyCategories->setChecked(flag("display_empty_categories"));
    for (int i = 0; i < 8; ++i)
        m_showFlags[i]->setChecked(flag(QLatin1String(showColumns[i])));
    m_showFlags[8]->setChecked(flag("show_projectaddress"));
    m_showFlags[9]->setChecked(flag("show_projectdescription"));
    m_projectAddress->setPlainText(text("projectaddress"));
    m_projectDescription->setPlainText(text("projectdescription"));
    for (int i = 0; i < 3; ++i) {
        m_showAddress[i]->setChecked(flag(QStringLiteral("show_address%1").arg(i + 1)));
        const QVariant id = vdr->data(0, QStringLiteral("address%1").arg(i + 1), Qt::EditRole);
        // A company removed since shows no selection.
        m_address[i]->setCurrentIndex(
            m_allCompanyModel && !id.isNull() ? m_allCompanyModel->getIndexForId(id.toInt()) : -1);
    }
}

bool VDRProjectDataWidget::writeVdrRow()
{
    VDRSqlTableModel* vdr = m_document->modelVdr();
    if (vdr->rowCount() == 0)
        return false;
    bool ok = true;
    auto set = [&](const QString& name, const QVariant& value) {
        if (vdr->data(0, name, Qt::EditRole) != value)
            ok &= vdr->setData(0, name, value);
    };
    set(QStringLiteral("name"), nonNull(m_name->text()));
    set(QStringLiteral("projectnumber"), nonNull(m_number->text()));
    for (int i = 0; i < 3; ++i) {
        set(QLatin1String(headlineColumns[i]), nonNull(m_headline[i]->text()));
        set(QLatin1String(footerColumns[i]), nonNull(m_footer[i]->text()));
    }
    set(QStringLiteral("display_empty_categories"), m_emptyCategories->isChecked() ? 1 : 0);
    for (int i = 0; i < 8; ++i)
        set(QLatin1String(showColumns[i]), m_showFlags[i]->isChecked() ? 1 : 0);
    set(QStringLiteral("show_projectaddress"), m_showFlags[8]->isChecked() ? 1 : 0);
    set(QStringLiteral("show_projectdescription"), m_showFlags[9]->isChecked() ? 1 : 0);
    set(QStringLiteral("projectaddress"), nonNull(m_projectAddress->toPlainText()));
    set(QStringLiteral("projectdescription"), nonNull(m_projectDescription->toPlainText()));
    for (int i = 0; i < 3; ++i) {
        set(QStringLiteral("show_address%1").arg(i + 1), m_showAddress[i]->isChecked() ? 1 : 0);
        const int id =
            m_allCompanyModel ? m_allCompanyModel->getIdForIndex(m_address[i]->currentIndex()) : -1;
        set(QStringLiteral("address%1").arg(i + 1), id);
    }
    return ok;
}

bool VDRProjectDataWidget::actionSubmit()
{
    if (!m_document || !m_document->modelVdr())
        return false;
    // Cells still being edited belong to what the user confirmed.
    for (QTableView* view : {m_table1, m_table2}) {
        if (QWidget* editor = view->indexWidget(view->currentIndex()))
            QMetaObject::invokeMethod(view, "commitData", Q_ARG(QWidget*, editor));
    }
    m_projectDescription->learnText();
    bool ok = true;
    m_document->beginTransaction();
    ok &= writeVdrRow();
    VDRSqlTableModel* models[] = {m_document->modelVdr(), m_document->modelCompany1(),
                                  m_document->modelCompany2()};
    QString error;
    for (VDRSqlTableModel* model : models) {
        if (!model->submitAll()) {
            ok = false;
            if (error.isEmpty())
                error = CVdShared::sqlErrorText(model->lastError());
        }
    }
    m_document->endTransaction();
    m_document->setModified(true);
    m_document->setMasterDataModified(false);
    saveCompanyOutputFormat1Settings();
    saveCompanyOutputFormat2Settings();
    storeCompanyColumnWidths();
    showAllRows();
    if (!ok)
        VDRPrompt::critical(tr("Datenbankfehler"),
                            tr("Die Projektdaten konnten nicht gespeichert werden.\n%1").arg(error));
    return ok;
}

void VDRProjectDataWidget::actionRevert()
{
    if (!m_document || !m_document->modelVdr())
        return;
    m_document->modelVdr()->revertAll();
    m_document->modelCompany1()->revertAll();
    m_document->modelCompany2()->revertAll();
    showAllRows();
}

void VDRProjectDataWidget::showAllRows()
{
    for (QTableView* view : {m_table1, m_table2}) {
        for (int row = 0; view->model() && row < view->model()->rowCount(); ++row)
            view->setRowHidden(row, false);
    }
}

void VDRProjectDataWidget::accept()
{
    if (!actionSubmit() && m_document)
        return; // the message said why; the dialog stays open with the user's input
    QDialog::accept();
}

void VDRProjectDataWidget::reject()
{
    actionRevert();
    QDialog::reject();
}

// ---- Company lists ----

void VDRProjectDataWidget::slotAddCompany1()
{
    if (!m_document || !m_document->appendCompany1(QString(" ")))
        return;
    const int row = m_document->modelCompany1()->rowCount() - 1;
    m_table1->setCurrentIndex(m_document->modelCompany1()->index(row, QStringLiteral("type")));
    m_table1->scrollTo(m_table1->currentIndex());
}

void VDRProjectDataWidget::slotAddCompany2()
{
    if (!m_document || !m_document->appendCompany2())
        return;
    const int row = m_document->modelCompany2()->rowCount() - 1;
    m_table2->setCurrentIndex(m_document->modelCompany2()->index(row, QStringLiteral("type")));
    m_table2->scrollTo(m_table2->currentIndex());
}

void VDRProjectDataWidget::slotRemoveCompany1()
{
    removeSelectedRows(m_table1);
}

void VDRProjectDataWidget::slotRemoveCompany2()
{
    hideRemovedRows(m_table2);
}

void VDRProjectDataWidget::removeSelectedRows(QTableView* view)
{
    auto* model = qobject_cast<VDRSqlTableModel*>(view->model());
    if (!model || !view->selectionModel())
        return;
    QList<int> rows;
    for (const QModelIndex& index : view->selectionModel()->selectedRows())
        rows << index.row();
    if (rows.isEmpty() && view->currentIndex().isValid())
        rows << view->currentIndex().row();
    // Frozen copies belong to locked reports, which must keep naming their companies.
    const int selected = rows.size();
    rows.erase(std::remove_if(rows.begin(), rows.end(),
                              [&](int row) {
                                  return model->data(row, QStringLiteral("category"), Qt::EditRole).toInt() <
                                         0;
                              }),
               rows.end());
    if (rows.isEmpty()) {
        if (selected > 0)
            VDRPrompt::information(
                tr("Eintrag entfernen"),
                tr("Der gewählte Eintrag wird von abgeschlossenen Berichten verwendet und kann "
                   "nicht entfernt werden."));
        return;
    }
    if (VDRPrompt::instance()->question(VDRPrompt::Question, tr("Eintrag entfernen"),
                                        tr("Soll der gewählte Eintrag tatsächlich entfernt werden?"),
                                        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::Yes,
                                        VDRPrompt::No) != VDRPrompt::Yes)
        return;
    std::sort(rows.begin(), rows.end(), std::greater<int>());
    for (int row : rows)
        model->removeRows(row, 1);
    view->clearSelection();
    hideRemovedRows(view);
}

void VDRProjectDataWidget::hideRemovedRows(QTableView* view)
{
    // The model keeps removed rows, marked "!", until the submit.
    for (int row = 0; view->model() && row < view->model()->rowCount(); ++row) {
        if (view->model()->headerData(row, Qt::Vertical).toString() == QLatin1String("!"))
            view->setRowHidden(row, true);
    }
}

// ---- Column widths ----

void VDRProjectDataWidget::restoreCompanyColumnWidths()
{
    const QSettings settings;
    const std::pair<VDRTableView*, QString> lists[] = {{m_table1, company1ColumnWidthsSettingsKey()},
                                                       {m_table2, company2ColumnWidthsSettingsKey()}};
    for (const auto& list : lists) {
        VDRTableView* view = list.first;
        auto* model = qobject_cast<VDRSqlTableModel*>(view->model());
        if (!model)
            continue;
        const QStringList widths = settings.value(list.second).toStringList();
        for (const CompanyColumn& column : companyColumns) {
            const int c = model->fieldIndex(QLatin1String(column.field));
            bool ok = false;
            const int width = widths.value(c).toInt(&ok);
            // The user's widths in pixels; shares of the width until there are any.
            if (ok && width > 0 && width < 5000)
                view->setColumnWidth(c, VDRTableView::CWT_PIXEL, width);
            else
                view->setColumnWidth(c, VDRTableView::CWT_PERCENT, column.share);
        }
        view->resizeColumns();
    }
}

void VDRProjectDataWidget::storeCompanyColumnWidths()
{
    QSettings settings;
    if (m_table1->model())
        settings.setValue(company1ColumnWidthsSettingsKey(), widthsOf(m_table1));
    if (m_table2->model())
        settings.setValue(company2ColumnWidthsSettingsKey(), widthsOf(m_table2));
}

// ---- Output formats ----

void VDRProjectDataWidget::restoreCompanyOutputFormat1Settings()
{
    CVdShared::restoreCompanyOutputFormats();
    m_f1[0] = CVdShared::companyOutputFormat1FieldIdx1();
    m_f1[1] = CVdShared::companyOutputFormat1FieldIdx2();
    m_f1[2] = CVdShared::companyOutputFormat1FieldIdx3();
    m_f1Brackets[0] = CVdShared::companyOutputFormat1Field2InBrackets();
    m_f1Brackets[1] = CVdShared::companyOutputFormat1Field3InBrackets();
    updateFormatWidgets();
}

void VDRProjectDataWidget::restoreCompanyOutputFormat2Settings()
{
    CVdShared::restoreCompanyOutputFormats();
    m_f2[0] = CVdShared::companyOutputFormat2FieldIdx1();
    m_f2[1] = CVdShared::companyOutputFormat2FieldIdx2();
    m_f2[2] = CVdShared::companyOutputFormat2FieldIdx3();
    m_f2[3] = CVdShared::companyOutputFormat2FieldIdx4();
    m_f2Brackets[0] = CVdShared::companyOutputFormat2Field3InBrackets();
    m_f2Brackets[1] = CVdShared::companyOutputFormat2Field4InBrackets();
    updateFormatWidgets();
}

void VDRProjectDataWidget::saveCompanyOutputFormat1Settings()
{
    CVdShared::setCompanyOutputFormat1FieldIdx1(m_f1[0]);
    CVdShared::setCompanyOutputFormat1FieldIdx2(m_f1[1]);
    CVdShared::setCompanyOutputFormat1FieldIdx3(m_f1[2]);
    CVdShared::setCompanyOutputFormat1Field2InBrackets(m_f1Brackets[0]);
    CVdShared::setCompanyOutputFormat1Field3InBrackets(m_f1Brackets[1]);
    CVdShared::saveCompanyOutputFormats();
}

void VDRProjectDataWidget::saveCompanyOutputFormat2Settings()
{
    CVdShared::setCompanyOutputFormat2FieldIdx1(m_f2[0]);
    CVdShared::setCompanyOutputFormat2FieldIdx2(m_f2[1]);
    CVdShared::setCompanyOutputFormat2FieldIdx3(m_f2[2]);
    CVdShared::setCompanyOutputFormat2FieldIdx4(m_f2[3]);
    CVdShared::setCompanyOutputFormat2Field3InBrackets(m_f2Brackets[0]);
    CVdShared::setCompanyOutputFormat2Field4InBrackets(m_f2Brackets[1]);
    CVdShared::saveCompanyOutputFormats();
}

void VDRProjectDataWidget::updateFormatWidgets()
{
    const QSignalBlocker blockers[] = {
        QSignalBlocker(m_format1Field[0]),    QSignalBlocker(m_format1Field[1]),
        QSignalBlocker(m_format1Field[2]),    QSignalBlocker(m_format1Brackets[0]),
        QSignalBlocker(m_format1Brackets[1]), QSignalBlocker(m_format2Field[0]),
        QSignalBlocker(m_format2Field[1]),    QSignalBlocker(m_format2Field[2]),
        QSignalBlocker(m_format2Field[3]),    QSignalBlocker(m_format2Brackets[0]),
        QSignalBlocker(m_format2Brackets[1])};
    for (int i = 0; i < 3; ++i)
        m_format1Field[i]->setCurrentIndex(m_f1[i]);
    for (int i = 0; i < 4; ++i)
        m_format2Field[i]->setCurrentIndex(m_f2[i]);
    for (int i = 0; i < 2; ++i) {
        m_format1Brackets[i]->setChecked(m_f1Brackets[i]);
        m_format2Brackets[i]->setChecked(m_f2Brackets[i]);
    }
    updateExamples();
}

void VDRProjectDataWidget::updateExamples()
{
    const QMap<QString, QString> example = createExampleCompany();
    m_format1Example->setText(CVdShared::formatCompany({m_f1[0], m_f1[1], m_f1[2]}, m_f1Brackets[0],
                                                       m_f1Brackets[1], example, QStringLiteral(" ")));
    m_format2Example->setText(CVdShared::formatCompany({m_f2[0], m_f2[1], m_f2[2], m_f2[3]}, m_f2Brackets[0],
                                                       m_f2Brackets[1], example, QStringLiteral(" ")));
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat1FieldIdx1(int index)
{
    m_f1[0] = qMax(0, index);
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat1FieldIdx2(int index)
{
    m_f1[1] = qMax(0, index);
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat1FieldIdx3(int index)
{
    m_f1[2] = qMax(0, index);
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat1Field2InBrackets(bool on)
{
    m_f1Brackets[0] = on;
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat1Field3InBrackets(bool on)
{
    m_f1Brackets[1] = on;
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat2FieldIdx1(int index)
{
    m_f2[0] = qMax(0, index);
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat2FieldIdx2(int index)
{
    m_f2[1] = qMax(0, index);
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat2FieldIdx3(int index)
{
    m_f2[2] = qMax(0, index);
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat2FieldIdx4(int index)
{
    m_f2[3] = qMax(0, index);
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat2Field3InBrackets(bool on)
{
    m_f2Brackets[0] = on;
    updateExamples();
}

void VDRProjectDataWidget::slot_updateCompanyOutputFormat2Field4InBrackets(bool on)
{
    m_f2Brackets[1] = on;
    updateExamples();
}

void VDRProjectDataWidget::on_pbFormat1Defaults_clicked()
{
    m_f1[0] = 0;
    m_f1[1] = 4;
    m_f1[2] = 1;
    m_f1Brackets[0] = false;
    m_f1Brackets[1] = true;
    updateFormatWidgets();
}

void VDRProjectDataWidget::on_pbFormat2Defaults_clicked()
{
    m_f2[0] = 0;
    m_f2[1] = 3;
    m_f2[2] = 4;
    m_f2[3] = 1;
    m_f2Brackets[0] = false;
    m_f2Brackets[1] = true;
    updateFormatWidgets();
}

void VDRProjectDataWidget::sl_printProjectData()
{
    emit printProjectDataRequested();
}

void VDRProjectDataWidget::sl_importCompanyData()
{
    emit importCompanyDataRequested();
}
