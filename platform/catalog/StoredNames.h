// Names as they are stored, where a name in another letter case finds the item too: so that an item
// has one name, one record and one path, however it was asked for.
//
// Nothing is looked at on volumes on which letter case counts, but for AsStoredByFolder.
#pragma once

#include <string>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"

namespace tallowmere::catalog {

// The item of a look under the name that its folder stores. The same look where that cannot be
// told: the folder may not be read, or several of its entries could be meant.
Look AsStored(Moment& moment, const Look& item);

// The same, where the folder alone may ignore letter case, too. To ask it takes three system calls.
Look AsStoredByFolder(Moment& moment, const Look& item);

// The path to the item of a reference with all names on the volume as they are stored. The same
// path where it does not lead to the item any more. REQUIRES: the path is canonical but for letter
// case.
std::string StoredPath(Moment& moment, const kernel::Item& reference, const std::string& path);

}  // namespace tallowmere::catalog
