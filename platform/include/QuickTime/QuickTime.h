// Memory handles, components and movie export, under the host's spelling.
//
// No call throws. Every call that returns a result code returns noErr for success, and paramErr for
// a null pointer where none is allowed and for an invalid component or instance. One thread at a
// time.
#pragma once

#include <MacTypes.h>

#include <cstddef>

extern "C" {

// Four characters as a number, the first one in the highest byte.
using OSType = UInt32;

// --- Memory handles ---------------------------------------------------------------------------

using Size = long;  // in bytes

// A block of memory, given as a pointer to the pointer to its bytes.
using Handle = char**;

// A new zero-filled block, which may be empty and which the caller owns. Null for a negative size
// and when there is not enough memory.
Handle NewHandleClear(Size byteCount);

// Frees a block. Does nothing for null and for a handle that is not a block's.
void DisposeHandle(Handle handle);

// The block's size. 0 for null and for a handle that is not a block's.
Size GetHandleSize(Handle handle);

// --- Components -------------------------------------------------------------------------------

struct ComponentRecord;
using Component = ComponentRecord*;

struct ComponentInstanceRecord;
using ComponentInstance = ComponentInstanceRecord*;

// Describes a component, or the ones to look for.
struct ComponentDescription {
  OSType componentType;          // looking: 0 for any
  OSType componentSubType;       // looking: 0 for any
  OSType componentManufacturer;  // looking: 0 for any
  UInt32 componentFlags;
  UInt32 componentFlagsMask;  // looking: which flags count
};

enum : OSType {
  MovieExportType = 0x73706974,  // 'spit', a component type
  kQTFileTypeAIFF = 0x41494646,  // 'AIFF', its subtype
  SoundMediaType = 0x736F756E,   // 'soun', a media type and its components' manufacturer
};

// The first component after `previous` (null: the first of all) that matches `looking`. Null when
// there is none, when `looking` is null and when `previous` is not a component.
Component FindNextComponent(Component previous, ComponentDescription* looking);

// Fills in the description. The three handles must be null: no component has a name, an information
// text or an icon.
OSErr GetComponentInfo(Component component, ComponentDescription* description, Handle name,
                       Handle info, Handle icon);

// A new instance, which the caller closes; null with every result but noErr. May return memFullErr.
OSErr OpenAComponent(Component component, ComponentInstance* instance);

OSErr CloseComponent(ComponentInstance instance);

// --- Movie export -----------------------------------------------------------------------------

using ComponentResult = SInt32;
using MovieExportComponent = ComponentInstance;
using UnsignedFixed = UInt32;  // 16 bits before the point, 16 after it

// The general form of every medium's description; here only passed on.
struct SampleDescription;
using SampleDescriptionHandle = SampleDescription**;

// How sound is stored, in the layout of the published movie file format and in this machine's byte
// order.
struct SoundDescription {
  SInt32 descSize;      // of the whole structure, in bytes
  OSType dataFormat;    // 'NONE', 'twos', …
  SInt32 resvd1;        // 0
  SInt16 resvd2;        // 0
  SInt16 dataRefIndex;  // 0
  SInt16 version;       // 0
  SInt16 revlevel;      // 0
  OSType vendor;        // 0
  SInt16 numChannels;   // from 1
  SInt16 sampleSize;    // in bits, as an unsigned number
  SInt16 compressionID;
  SInt16 packetSize;
  UnsignedFixed sampleRate;  // in hertz
};
static_assert(sizeof(SoundDescription) == 36);
static_assert(offsetof(SoundDescription, numChannels) == 24);
static_assert(offsetof(SoundDescription, sampleRate) == 32);

// Tells an exporter the sound that it will be given. The block holds a SoundDescription and stays
// the caller's. Unless the result is noErr, the exporter keeps the sound it was told before.
//
//   paramErr   the size or the medium is not a sound description's, there are no channels, the rate
//              is 0, or the sample size is 0 in an uncompressed format
//   badFormat  a format that the file cannot hold
ComponentResult MovieExportSetSampleDescription(MovieExportComponent exporter,
                                                SampleDescriptionHandle description,
                                                OSType mediaType);

using QTAtomContainer = Handle;

// The exporter's settings for the sound that it was told, as a new block that the caller owns; null
// with every result but noErr. paramErr when it was told none; memFullErr when there is not enough
// memory.
ComponentResult MovieExportGetSettingsAsAtomContainer(MovieExportComponent exporter,
                                                      QTAtomContainer* settings);
}
