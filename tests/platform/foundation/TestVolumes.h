// The mounted volumes that HFS paths meet in these tests: "Root" at "/", "Data" at "/mnt/data", and
// "Data:2" (in the HFS view "Data/2") at "/mnt/Data:2".
#pragma once

namespace tallowmere::foundation::test {

// Takes the volumes away, or brings them back.
void SetVolumesAreMounted(bool mounted);

}  // namespace tallowmere::foundation::test
