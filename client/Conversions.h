// The conversions, one class each: what each asks the service, and what it makes of the answers.
#pragma once

#include <tallowmere/Conversion.h>
#include <tallowmere/Types.h>

#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "client/Exchange.h"

namespace tallowmere::conversion {

template <class T>
using Handler = std::function<void(Conversion<T>)>;

std::unique_ptr<Inquiry> RecordOf(Exchange& exchange, std::string_view path,
                                  Handler<FSSpec> handler);
std::unique_ptr<Inquiry> PathOf(Exchange& exchange, const FSSpec& record, bool searchOtherVolumes,
                                Handler<std::string> handler);
std::unique_ptr<Inquiry> HFSPathOf(Exchange& exchange, std::string_view path,
                                   Handler<std::string> handler);
std::unique_ptr<Inquiry> PathOfHFSPath(Exchange& exchange, std::string_view hfsPath,
                                       Handler<std::string> handler);
std::unique_ptr<Inquiry> HFSNameOf(Exchange& exchange, std::string_view path,
                                   Handler<std::string> handler);
std::unique_ptr<Inquiry> PathInFolder(Exchange& exchange, std::string_view folder,
                                      std::string_view hfsName, Handler<std::string> handler);

}  // namespace tallowmere::conversion
