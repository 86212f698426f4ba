#include "app/MyProxyStyle.h"

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
