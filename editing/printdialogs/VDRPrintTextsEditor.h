#pragma once

#include <QDialog>

class QSortFilterProxyModel;
class QTableView;
class VDRPrintTextModel;

// Lets the user replace the print texts of the current interface language.
class VDRPrintTextsEditor : public QDialog
{
    Q_OBJECT
public:
    VDRPrintTextsEditor(VDRPrintTextModel* model, QWidget* parent);

    QTableView* view() const { return m_view; }

public slots:
    void accept() override;
    void reject() override;
    void resetToDefaults();

protected:
    void closeEvent(QCloseEvent* event) override;

private:
    bool confirmDiscard();
    void saveGeometrySettings();

    VDRPrintTextModel* m_model;
    QSortFilterProxyModel* m_proxy;
    QTableView* m_view;
    bool m_changed = false;
};
