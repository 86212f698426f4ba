#pragma once

#include <QListView>

// The drop-down list of VDRTextEditComboBox: Return or a click picks the entry.
class VDRTextEditComboBoxListView : public QListView
{
    Q_OBJECT
public:
    explicit VDRTextEditComboBoxListView(QWidget* parent = nullptr);

signals:
    void picked(int row);

protected:
    void keyPressEvent(QKeyEvent* event) override;
};
