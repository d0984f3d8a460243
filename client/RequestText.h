// Says in words what a request asks for.
#pragma once

#include <string>
#include <string_view>

namespace tallowmere {

// Such as `the record of "/etc/hostname"`. REQUIRES: the bytes are one whole request.
std::string WhatIsAsked(std::string_view request);

// Whether the request may lead the service to volumes that it does not name.
bool SearchesOtherVolumes(std::string_view request);

}  // namespace tallowmere
