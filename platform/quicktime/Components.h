// The components that exist and their open instances. There is one component, the exporter of AIFF
// files.
//
// An instance stays open until it is closed or the process ends.
#pragma once

#include <QuickTime/QuickTime.h>

#include <cstddef>

#include "quicktime/AIFFExporter.h"

namespace tallowmere::quicktime {

std::size_t OpenInstances();

// The exporter behind an instance. Null when the instance is not open.
AIFFExporter* ExporterOf(ComponentInstance instance);

}  // namespace tallowmere::quicktime
