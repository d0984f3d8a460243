// The commands, one function each, in three steps: read the fields, do the work, write the answer.
//
// A command starts its work only after its last field has arrived; when the channel has failed by
// then, it returns at once. Work that makes several host calls is done within one moment, which
// ends before the answer is written. The caller writes the trailer.
#pragma once

#include "service/Channel.h"

namespace tallowmere::service {

void GetVolRefnumByHFSName(Channel& channel);
void GetHFSVolumeName(Channel& channel);

void MakeFullPath(Channel& channel);
void MakeFileRefFromPath(Channel& channel);
void AddHFSName(Channel& channel);

void GetHFSName(Channel& channel);
void GetFSSpec(Channel& channel);
void SetFileRefFromFSSpecData(Channel& channel);
void SetFileRefFromFSSpec(Channel& channel);

void GetAIFFExportSettings(Channel& channel);

}  // namespace tallowmere::service
