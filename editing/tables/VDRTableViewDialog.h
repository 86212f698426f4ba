#pragma once

#include <QDialog>

class VDRTableView;

// The enlarged table: the same model, delegate and columns as the small view it was opened from.
class VDRTableViewDialog : public QDialog
{
    Q_OBJECT
public:
    VDRTableViewDialog(VDRTableView* smallView, QWidget* parent = nullptr);
    VDRTableView* view() const { return m_view; }

public slots:
    void slot_startTimeRecording(int row, int id, int entryId);
    void slot_entrydataDfcy_startImageAssignDialog(int row, int id, int entryId);

private:
    VDRTableView* m_small;
    VDRTableView* m_view;
};
