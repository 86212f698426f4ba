#include "editing/masterdata/VDRProjectLogoWidget.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"

#include <QComboBox>
#include <QDir>
#include <QFileInfo>
#include <QGridLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QImageReader>
#include <QLabel>
#include <QMetaMethod>
#include <QPushButton>
#include <QSettings>
#include <QSqlError>
#include <QVBoxLayout>

namespace {
const QSize kPreviewSize(320, 120);
// Column names of the first and the second logo.
const char* const kIdColumn[] = {"logo_image_id", "logo2_image_id"};
const char* const kAlignColumn[] = {"logo_align", "logo2_align"};
const char* const kLastFolderKey = "ProjectLogo/lastFolder";
} // namespace

VDRProjectLogoWidget::VDRProjectLogoWidget(QWidget* parent) : QDialog(parent)
{
    setObjectName(QStringLiteral("VDRProjectLogoWidget"));
    setWindowTitle(tr("Projektlogo"));
    auto* layout = new QVBoxLayout(this);
    const QString titles[] = {tr("Logo"), tr("Zweites Logo")};
    for (int i = 0; i < LogoCount; ++i) {
        Logo& logo = m_logos[i];
        const QString suffix = i == 0 ? QString() : QStringLiteral("2");
        auto* group = new QGroupBox(titles[i], this);
        group->setObjectName(QStringLiteral("groupBoxLogo") + suffix);
        auto* grid = new QGridLayout(group);
        logo.preview = new QLabel(group);
        logo.preview->setObjectName(QStringLiteral("labelPreview") + suffix);
        logo.preview->setMinimumSize(kPreviewSize);
        logo.preview->setAlignment(Qt::AlignCenter);
        logo.preview->setFrameShape(QFrame::StyledPanel);
        logo.insert = new QPushButton(tr("Neues Logo einfügen"), group);
        logo.insert->setObjectName(QStringLiteral("pbInsertLogo") + suffix);
        logo.remove = new QPushButton(tr("Aktuelles Logo entfernen"), group);
        logo.remove->setObjectName(QStringLiteral("pbRemoveLogo") + suffix);
        logo.align = new QComboBox(group);
        logo.align->setObjectName(QStringLiteral("comboBoxAlign") + suffix);
        logo.align->addItem(tr("Links"), 1);
        logo.align->addItem(tr("Zentriert"), 2);
        logo.align->addItem(tr("Rechts"), 3);
        grid->addWidget(logo.preview, 0, 0, 4, 1);
        grid->addWidget(logo.insert, 0, 1, 1, 2);
        grid->addWidget(logo.remove, 1, 1, 1, 2);
        grid->addWidget(new QLabel(tr("Ausrichtung:"), group), 2, 1);
        grid->addWidget(logo.align, 2, 2);
        grid->setColumnStretch(0, 1);
        layout->addWidget(group);
        connect(logo.insert, &QPushButton::clicked, this, [this, i] { insertLogo(i); });
        connect(logo.remove, &QPushButton::clicked, this, [this, i] { removeLogo(i); });
    }

    m_settings = new QPushButton(tr("Einstellungen"), this);
    m_settings->setObjectName(QStringLiteral("pbSettings"));
    auto* ok = new QPushButton(tr("OK"), this);
    ok->setObjectName(QStringLiteral("pbOk"));
    ok->setDefault(true);
    auto* cancel = new QPushButton(tr("Abbrechen"), this);
    cancel->setObjectName(QStringLiteral("pbCancel"));
    auto* buttons = new QHBoxLayout;
    buttons->addWidget(m_settings);
    buttons->addStretch();
    buttons->addWidget(ok);
    buttons->addWidget(cancel);
    layout->addLayout(buttons);
    connect(m_settings, &QPushButton::clicked, this, &VDRProjectLogoWidget::printoutSettingsRequested);
    connect(ok, &QPushButton::clicked, this, &VDRProjectLogoWidget::accept);
    connect(cancel, &QPushButton::clicked, this, &VDRProjectLogoWidget::reject);
    updateGui();
}

VDRProjectLogoWidget::~VDRProjectLogoWidget()
{
    // Closed without OK or Abbrechen: nothing of this session may stay behind.
    if (!m_created.isEmpty())
        actionRevert();
}

void VDRProjectLogoWidget::slotDocumentOpened(VDRDocument* document)
{
    m_document = document;
    readVdrRow();
    updateGui();
}

void VDRProjectLogoWidget::slotDocumentClosed(VDRDocument* document)
{
    if (document != m_document)
        return;
    m_created.clear(); // the document removes its own pictures with its working copy
    m_document = nullptr;
    for (Logo& logo : m_logos)
        logo.storedId = logo.imageId = -1;
    updateGui();
}

void VDRProjectLogoWidget::showEvent(QShowEvent* event)
{
    if (m_created.isEmpty())
        readVdrRow();
    m_settings->setVisible(
        isSignalConnected(QMetaMethod::fromSignal(&VDRProjectLogoWidget::printoutSettingsRequested)));
    updateGui();
    QDialog::showEvent(event);
}

bool VDRProjectLogoWidget::hasSecondLogo() const
{
    return m_document && m_document->modelVdr() &&
           m_document->modelVdr()->fieldIndex(QLatin1String(kIdColumn[1])) >= 0;
}

void VDRProjectLogoWidget::readVdrRow()
{
    if (!m_document || !m_document->modelVdr())
        return;
    VDRSqlTableModel* vdr = m_document->modelVdr();
    if (!vdr->isDirty())
        vdr->select();
    if (vdr->rowCount() == 0)
        return;
    for (int i = 0; i < LogoCount; ++i) {
        if (i == 1 && !hasSecondLogo())
            break;
        Logo& logo = m_logos[i];
        const QVariant id = vdr->data(0, QLatin1String(kIdColumn[i]), Qt::EditRole);
        // No logo is NULL for the first and 0 for the second.
        logo.storedId = logo.imageId = id.isNull() || id.toInt() <= 0 ? -1 : id.toInt();
        const int align = vdr->data(0, QLatin1String(kAlignColumn[i]), Qt::EditRole).toInt();
        // A second logo without placement yet goes to the right, opposite the first one's default.
        const int index = logo.align->findData(align);
        logo.align->setCurrentIndex(index >= 0 ? index : (i == 0 ? 1 : 2));
    }
}

void VDRProjectLogoWidget::updateGui()
{
    for (int i = 0; i < LogoCount; ++i) {
        Logo& logo = m_logos[i];
        const bool available = m_document && (i == 0 || hasSecondLogo());
        logo.insert->setEnabled(available);
        logo.remove->setEnabled(available && logo.imageId > 0);
        logo.align->setEnabled(available);
        QPixmap pixmap;
        if (available && logo.imageId > 0)
            pixmap = m_document->getImagePixmap(logo.imageId);
        if (pixmap.isNull()) {
            logo.preview->setPixmap(QPixmap());
            logo.preview->setText(logo.imageId > 0 ? tr("Das Logo kann nicht angezeigt werden.")
                                                   : tr("Kein Logo"));
        } else {
            logo.preview->setPixmap(
                pixmap.scaled(kPreviewSize, Qt::KeepAspectRatio, Qt::SmoothTransformation));
        }
    }
}

void VDRProjectLogoWidget::insertLogo(int logo)
{
    if (!m_document || logo < 0 || logo >= LogoCount || (logo == 1 && !hasSecondLogo()))
        return;
    QSettings settings;
    const QString path = VDRPrompt::instance()->openFileName(
        tr("Logo auswählen"), settings.value(QLatin1String(kLastFolderKey), QDir::homePath()).toString(),
        tr("Bilder (*.png *.jpg *.bmp)"));
    if (path.isEmpty())
        return;
    settings.setValue(QLatin1String(kLastFolderKey), QFileInfo(path).absolutePath());

    const QString name = QDir::toNativeSeparators(path);
    QImageReader reader(path);
    reader.setDecideFormatFromContent(true);
    if (!reader.canRead()) {
        VDRPrompt::warning(tr("Logo auswählen"),
                           tr("Die Datei\n%1\nist kein Bild, das als Logo verwendet werden kann.").arg(name));
        return;
    }
    int id = -1;
    {
        VDRBusyCursor busy;
        id = m_document->createImage(path);
    }
    if (id < 0) {
        const QSize size = reader.size();
        VDRPrompt::warning(tr("Logo auswählen"),
                           size.isValid()
                               ? tr("Das Bild\n%1\n(%2 × %3 Pixel) ist zu groß oder beschädigt und kann "
                                    "nicht als Logo verwendet werden.")
                                     .arg(name)
                                     .arg(size.width())
                                     .arg(size.height())
                               : tr("Das Bild\n%1\nkann nicht gelesen werden.").arg(name));
        return;
    }
    m_created << id;
    release(m_logos[logo].imageId);
    m_logos[logo].imageId = id;
    updateGui();
}

void VDRProjectLogoWidget::removeLogo(int logo)
{
    if (!m_document || logo < 0 || logo >= LogoCount)
        return;
    release(m_logos[logo].imageId);
    m_logos[logo].imageId = -1;
    updateGui();
}

void VDRProjectLogoWidget::release(int imageId)
{
    // The stored logo stays until OK, so that Abbrechen can keep it.
    if (imageId > 0 && m_created.removeAll(imageId) > 0)
        m_document->deleteImage(imageId);
}

bool VDRProjectLogoWidget::actionSubmit()
{
    if (!m_document || !m_document->modelVdr() || m_document->modelVdr()->rowCount() == 0)
        return false;
    VDRSqlTableModel* vdr = m_document->modelVdr();
    bool ok = true;
    m_document->beginTransaction();
    for (int i = 0; i < LogoCount; ++i) {
        if (i == 1 && !hasSecondLogo())
            break;
        const Logo& logo = m_logos[i];
        const QVariant none = i == 0 ? QVariant(QVariant::Int) : QVariant(0);
        const QVariant id = logo.imageId > 0 ? QVariant(logo.imageId) : none;
        if (vdr->data(0, QLatin1String(kIdColumn[i]), Qt::EditRole) != id)
            ok &= vdr->setData(0, QLatin1String(kIdColumn[i]), id);
        const int align = logo.align->currentData().toInt();
        // A second logo that is not there keeps its stored placement.
        if (i == 1 && logo.imageId <= 0)
            continue;
        if (vdr->data(0, QLatin1String(kAlignColumn[i]), Qt::EditRole).toInt() != align)
            ok &= vdr->setData(0, QLatin1String(kAlignColumn[i]), align);
    }
    ok = ok && vdr->submitAll();
    if (ok) {
        // Pictures no logo uses any more leave the diary.
        for (Logo& logo : m_logos) {
            if (logo.storedId > 0 && logo.storedId != logo.imageId)
                m_document->deleteImage(logo.storedId);
            logo.storedId = logo.imageId;
        }
        m_created.clear();
        m_document->setModified(true);
    }
    m_document->endTransaction();
    if (!ok) {
        const QString error = CVdShared::sqlErrorText(vdr->lastError());
        vdr->revertAll();
        VDRPrompt::critical(tr("Datenbankfehler"),
                            tr("Das Logo konnte nicht gespeichert werden.\n%1").arg(error));
    }
    return ok;
}

void VDRProjectLogoWidget::actionRevert()
{
    if (!m_document)
        return;
    for (int id : qAsConst(m_created))
        m_document->deleteImage(id);
    m_created.clear();
    if (m_document->modelVdr())
        m_document->modelVdr()->revertAll();
    for (Logo& logo : m_logos)
        logo.imageId = logo.storedId;
    updateGui();
}

void VDRProjectLogoWidget::accept()
{
    if (m_document && !actionSubmit())
        return;
    QDialog::accept();
}

void VDRProjectLogoWidget::reject()
{
    actionRevert();
    QDialog::reject();
}
