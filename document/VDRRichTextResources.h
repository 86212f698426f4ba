#pragma once

class QString;
class QTextDocument;

// What a stored rich text may show: only pictures it carries itself (data: URLs) of a sane size.
// A text written by the mobile app or by hand must not pull files of this computer into the form
// or into a printout that is handed on. Qt would read a picture named by a path straight from the
// disk, so every picture the text names is given to the document before the text is set; the
// stored text keeps its names.
namespace VDRRichTextResources {
// Call before document->setHtml(html) (or a text edit's setHtml on that document).
void guard(QTextDocument* document, const QString& html);
} // namespace VDRRichTextResources
