// Which components there are, and which of their instances are open. There is one component, the
// exporter of AIFF files.
//
// An instance is open until it is closed or the process ends.
#pragma once

#include <QuickTime/QuickTime.h>

#include <cstddef>

#include "quicktime/AIFFExporter.h"

namespace tallowmere::quicktime {

std::size_t OpenInstances();

// The exporter that an instance is. Null when it is no open instance.
AIFFExporter* ExporterOf(ComponentInstance instance);

}  // namespace tallowmere::quicktime
