#include "app/MyProxyStyle.h"

#include <QGuiApplication>
#include <QStyleOption>
#include <QWidget>

int MyProxyStyle::pixelMetric(PixelMetric metric, const QStyleOption* option, const QWidget* widget) const
{
    if (metric == PM_ScrollView_ScrollBarOverlap)
        return 0;
    return QProxyStyle::pixelMetric(metric, option, widget);
}

int MyProxyStyle::styleHint(StyleHint hint, const QStyleOption* option, const QWidget* widget,
                            QStyleHintReturn* returnData) const
{
    if (hint == SH_ScrollBar_Transient)
        return 0;
    return QProxyStyle::styleHint(hint, option, widget, returnData);
}

QIcon MyProxyStyle::standardIcon(StandardPixmap standardIcon, const QStyleOption* option,
                                 const QWidget* widget) const
{
    // Every dock title bar asks for the same few icons dozens of times while the window is laid out,
    // and each answer reads several image files; only the direction can change the picture.
    const Qt::LayoutDirection direction = option   ? option->direction
                                          : widget ? widget->layoutDirection()
                                                   : QGuiApplication::layoutDirection();
    const int key = int(standardIcon) * 2 + (direction == Qt::RightToLeft ? 1 : 0);
    const auto cached = m_icons.constFind(key);
    if (cached != m_icons.constEnd())
        return *cached;
    const QIcon icon = QProxyStyle::standardIcon(standardIcon, option, widget);
    m_icons.insert(key, icon);
    return icon;
}
