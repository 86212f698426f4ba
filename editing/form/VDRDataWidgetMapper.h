#pragma once

#include <QObject>
#include <QPointer>
#include <QVector>

class VDRSqlTableModel;

// Binds the report form's widgets to one row of a model. Unlike QDataWidgetMapper it writes a
// value back only when it differs, and keeps a rich-text editor's cursor and scroll position.
class VDRDataWidgetMapper : public QObject
{
    Q_OBJECT
public:
    enum SubmitPolicy
    {
        AutoSubmit,
        ManualSubmit
    };

    explicit VDRDataWidgetMapper(QObject* parent = nullptr);

    void setModel(VDRSqlTableModel* model);
    VDRSqlTableModel* model() const { return m_model; }

    void addMapping(QObject* widget, int column, const QByteArray& propertyName);
    void addMapping(QObject* widget, const QString& field, const QByteArray& propertyName);
    void clearMapping();

    void setSubmitPolicy(SubmitPolicy policy) { m_policy = policy; }
    SubmitPolicy submitPolicy() const { return m_policy; }

    int currentRow() const { return m_row; }
    void setCurrentRow(int row);
    void toFirst();
    void toLast();
    void toNext();
    void toPrevious();

    void populate();
    void populateEmpty();
    bool commit(int column);
    bool submit();
    void revert();

signals:
    void currentRowChanged(int row);

protected:
    bool eventFilter(QObject* watched, QEvent* event) override;

private slots:
    void slotDataChanged(const QModelIndex& topLeft, const QModelIndex& bottomRight);

private:
    struct Mapping
    {
        QPointer<QObject> widget;
        int column;
        QByteArray property;
    };
    QObject* target(const Mapping& m) const;
    QByteArray targetProperty(const Mapping& m) const;
    void populate(const Mapping& m);

    VDRSqlTableModel* m_model = nullptr;
    QVector<Mapping> m_mappings;
    int m_row = -1;
    SubmitPolicy m_policy = AutoSubmit;
};
