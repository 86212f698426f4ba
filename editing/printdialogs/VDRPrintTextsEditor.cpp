#include "editing/printdialogs/VDRPrintTextsEditor.h"

#include "document/VDRPrompt.h"
#include "printing/CVdTexts.h"
#include "printing/VDRPrintTextModel.h"

#include <QCloseEvent>
#include <QHBoxLayout>
#include <QHeaderView>
#include <QLabel>
#include <QPushButton>
#include <QSettings>
#include <QSortFilterProxyModel>
#include <QTableView>
#include <QVBoxLayout>

VDRPrintTextsEditor::VDRPrintTextsEditor(VDRPrintTextModel* model, QWidget* parent)
    : QDialog(parent), m_model(model)
{
    setObjectName(QStringLiteral("VDRPrintTextsEditor"));
    setWindowTitle(tr("Drucktexte ändern"));
    setWindowIcon(
        QIcon(QStringLiteral(":/VDRMainWindow/Resources/6 Einstellungen/07-einstellungen-texte-druck.ico")));
    auto* label = new QLabel(
        tr("Hier können die standardmäßig im Ausdruck der Berichte verwendeten Texte geändert werden. In der "
           "linken "
           "Spalte stehen die voreingestellten Texte, in der rechten Spalte können diese geändert, durch "
           "eigene "
           "Texte ersetzt, oder auch gelöscht werden. Die Platzhalter %1, %2 etc. werden im Ausdruck mit "
           "entsprechenden Zählern belegt und sollten nicht verändert werden. Die Liste der Texte ist "
           "alphabetisch sortiert."),
        this);
    label->setWordWrap(true);
    m_proxy = new QSortFilterProxyModel(this);
    m_proxy->setSourceModel(model);
    m_proxy->sort(1);
    m_view = new QTableView(this);
    m_view->setModel(m_proxy);
    // Default on the left, the printed text on the right.
    m_view->horizontalHeader()->moveSection(1, 0);
    m_view->horizontalHeader()->setSectionResizeMode(QHeaderView::Stretch);
    auto* ok = new QPushButton(tr("OK"), this);
    ok->setObjectName(QStringLiteral("pbOk"));
    auto* cancel = new QPushButton(tr("Abbrechen"), this);
    cancel->setObjectName(QStringLiteral("pbCancel"));
    auto* reset = new QPushButton(tr("Auf Werkseinstellungen zurücksetzen"), this);
    reset->setObjectName(QStringLiteral("pbReset"));
    connect(ok, &QPushButton::clicked, this, &VDRPrintTextsEditor::accept);
    connect(cancel, &QPushButton::clicked, this, &VDRPrintTextsEditor::reject);
    connect(reset, &QPushButton::clicked, this, &VDRPrintTextsEditor::resetToDefaults);
    connect(model, &QAbstractItemModel::dataChanged, this, [this] { m_changed = true; });
    auto* buttons = new QHBoxLayout;
    buttons->addWidget(reset);
    buttons->addStretch();
    buttons->addWidget(ok);
    buttons->addWidget(cancel);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(label);
    layout->addWidget(m_view);
    layout->addLayout(buttons);
    resize(800, 600);

    QSettings settings;
    settings.beginGroup(QStringLiteral("Geometries/PrintTexts"));
    restoreGeometry(settings.value(QStringLiteral("Geometry")).toByteArray());
    m_view->horizontalHeader()->restoreState(settings.value(QStringLiteral("HeaderH")).toByteArray());
    m_view->verticalHeader()->restoreState(settings.value(QStringLiteral("HeaderV")).toByteArray());
}

void VDRPrintTextsEditor::saveGeometrySettings()
{
    QSettings settings;
    settings.beginGroup(QStringLiteral("Geometries/PrintTexts"));
    settings.setValue(QStringLiteral("Geometry"), saveGeometry());
    settings.setValue(QStringLiteral("HeaderH"), m_view->horizontalHeader()->saveState());
    settings.setValue(QStringLiteral("HeaderV"), m_view->verticalHeader()->saveState());
}

void VDRPrintTextsEditor::accept()
{
    m_model->writeSettings();
    m_changed = false;
    saveGeometrySettings();
    QDialog::accept();
}

bool VDRPrintTextsEditor::confirmDiscard()
{
    if (!m_changed)
        return true;
    const int answer = VDRPrompt::instance()->question(
        VDRPrompt::Question, tr("Änderungen verwerfen"), tr("Sollen die Änderungen verworfen werden?"),
        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::No, VDRPrompt::No);
    if (answer != VDRPrompt::Yes)
        return false;
    // Back to what is stored.
    m_model->readSettings();
    m_changed = false;
    return true;
}

void VDRPrintTextsEditor::reject()
{
    if (!confirmDiscard())
        return;
    saveGeometrySettings();
    QDialog::reject();
}

void VDRPrintTextsEditor::closeEvent(QCloseEvent* event)
{
    if (!confirmDiscard()) {
        event->ignore();
        return;
    }
    saveGeometrySettings();
    QDialog::closeEvent(event);
}

void VDRPrintTextsEditor::resetToDefaults()
{
    const int answer =
        VDRPrompt::instance()->question(VDRPrompt::Question, tr("Drucktexte ändern"),
                                        tr("Beim Zurücksetzen gehen alle bisherigen Änderungen an den "
                                           "Standardtexten verloren. Möchten Sie wirklich "
                                           "zurücksetzen?"),
                                        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::No, VDRPrompt::No);
    if (answer != VDRPrompt::Yes)
        return;
    m_model->initSettings(CVdTexts::self()->TextList);
    m_changed = true;
}
