// References to items as the host holds them, and records of items.
#pragma once

#include <CoreServices/CoreServices.h>

#include <optional>
#include <string_view>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Item.h"
#include "kernel/Result.h"

namespace tallowmere::calls {

FSRef Pack(const kernel::Item& item);

// Nullopt for null and for what Pack does not make, all zero among it.
std::optional<kernel::Item> Unpack(const FSRef* reference);

// A reference to an item that was just seen, with its proof. Its place is remembered.
FSRef ReferenceTo(catalog::Moment& moment, const catalog::Look& look);
FSRef ReferenceTo(catalog::Moment& moment, const catalog::HeldFolder& folder);
FSRef ReferenceTo(catalog::Moment& moment, const catalog::Sighting& seen);

// The record of a volume's root folder; kNoVolume for null.
kernel::Result<FSSpec> RecordOfRoot(const volumes::VolumePointer& volume);

// The record of an item: that of its volume's root folder, or of what its folder holds.
kernel::Result<FSSpec> RecordOf(catalog::Moment& moment, const catalog::Look& item);

// A record; a name beyond 63 bytes is cut.
FSSpec MakeRecord(SInt16 vRefNum, UInt32 parID, std::string_view name);

// Whether an item seen just now is the root folder of its volume, and that volume; null when not.
volumes::VolumePointer VolumeOfRoot(catalog::Moment& moment, const catalog::Sighting& seen);

}  // namespace tallowmere::calls
