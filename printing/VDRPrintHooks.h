#pragma once

#include <QStringList>

#include <functional>

class QPrinter;

// The window's printer dialog, preview and file opener, installed from above so that the
// printouts stay free of widgets. Unset, the printer dialog counts as cancelled and the others
// do nothing (command line, tests).
class VDRPrintHooks
{
public:
    using PrintDialog = std::function<bool(QPrinter*)>;
    using Preview = std::function<void(const QStringList& pageFiles)>;
    using OpenFile = std::function<void(const QString& path)>;

    static void setPrintDialog(PrintDialog hook) { printDialogHook() = std::move(hook); }
    static void setPreview(Preview hook) { previewHook() = std::move(hook); }
    static void setOpenFile(OpenFile hook) { openFileHook() = std::move(hook); }

    static bool printDialog(QPrinter* printer)
    {
        return printDialogHook() ? printDialogHook()(printer) : false;
    }
    static void preview(const QStringList& files)
    {
        if (previewHook())
            previewHook()(files);
    }
    static void openFile(const QString& path)
    {
        if (openFileHook())
            openFileHook()(path);
    }

private:
    static PrintDialog& printDialogHook()
    {
        static PrintDialog hook;
        return hook;
    }
    static Preview& previewHook()
    {
        static Preview hook;
        return hook;
    }
    static OpenFile& openFileHook()
    {
        static OpenFile hook;
        return hook;
    }
};
