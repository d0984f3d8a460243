// Fake volumes for tests of HFS paths: "Root" at "/", "Data" at "/mnt/data", and "Data:2" (HFS name
// "Data/2") at "/mnt/Data:2".
#pragma once

namespace tallowmere::foundation::test {

// Unmounts or mounts the fake volumes.
void SetVolumesAreMounted(bool mounted);

}  // namespace tallowmere::foundation::test
