// Converts items to the host's references and records, and back.
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

// Nullopt for a null pointer and for bytes that Pack does not make, such as all zeros.
std::optional<kernel::Item> Unpack(const FSRef* reference);

// A reference to an item just seen, with its proof. Remembers its place.
FSRef ReferenceTo(catalog::Moment& moment, const catalog::Look& look);
FSRef ReferenceTo(catalog::Moment& moment, const catalog::HeldFolder& folder);
FSRef ReferenceTo(catalog::Moment& moment, const catalog::Sighting& seen);

// The record of a volume's root folder. Returns kNoVolume for null.
kernel::Result<FSSpec> RecordOfRoot(const volumes::VolumePointer& volume);

// The record of an item, which may be its volume's root folder.
kernel::Result<FSSpec> RecordOf(catalog::Moment& moment, const catalog::Look& item);

// A record. A longer name is cut at 63 bytes.
FSSpec MakeRecord(SInt16 vRefNum, UInt32 parID, std::string_view name);

// The volume whose root folder an item seen just now is, or null.
volumes::VolumePointer VolumeOfRoot(catalog::Moment& moment, const catalog::Sighting& seen);

}  // namespace tallowmere::calls
