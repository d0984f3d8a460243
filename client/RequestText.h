// Says in words what a request asks for.
#pragma once

#include <string>
#include <string_view>

namespace tallowmere {

// Such as `the record of "/etc/hostname"`. REQUIRES: `bytes` are one whole request.
std::string WhatIsAsked(std::string_view bytes);

// Whether a request may lead the service to volumes that it does not name.
bool SearchesOtherVolumes(std::string_view bytes);

}  // namespace tallowmere
