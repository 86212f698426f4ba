#pragma once

// Installs the window's printer dialog, print preview and PDF opener for the printouts.
namespace VDRPrintWidgets {
void install();
}
