#pragma once

#include <QDialog>
#include <QList>
#include <QPointer>

class QComboBox;
class QLabel;
class QPushButton;
class VDRDocument;

// The project logos printed in the page header: insert (through the image store), remove,
// alignment and a preview, for the first logo and the second one. Nothing reaches the vdr row
// before OK; pictures stored for a cancelled choice are removed again.
class VDRProjectLogoWidget : public QDialog
{
    Q_OBJECT
public:
    explicit VDRProjectLogoWidget(QWidget* parent = nullptr);
    ~VDRProjectLogoWidget() override;

    static constexpr int LogoCount = 2;
    // The image id a logo shows now (-1 for none), before OK.
    int logoImageId(int logo) const { return m_logos[logo].imageId; }

public slots:
    void slotDocumentOpened(VDRDocument* document);
    void slotDocumentClosed(VDRDocument* document);
    bool actionSubmit();
    void actionRevert();
    void updateGui();
    void accept() override;
    void reject() override;

    void insertLogo(int logo);
    void removeLogo(int logo);

signals:
    // "Einstellungen": the printout settings live above this dialog.
    void printoutSettingsRequested();

protected:
    void showEvent(QShowEvent* event) override;

private:
    struct Logo
    {
        QLabel* preview = nullptr;
        QComboBox* align = nullptr;
        QPushButton* insert = nullptr;
        QPushButton* remove = nullptr;
        int storedId = -1; // what the vdr row holds
        int imageId = -1;  // what the dialog shows
    };
    void readVdrRow();
    // Forgets a picture the dialog no longer shows: one stored in this session is deleted now.
    void release(int imageId);
    bool hasSecondLogo() const;

    QPointer<VDRDocument> m_document;
    Logo m_logos[LogoCount];
    QList<int> m_created; // pictures stored since the dialog was opened
    QPushButton* m_settings = nullptr;
};
