// Memory handles, components and movie export, under the host's spelling.
//
// No call throws. Every call that answers with a result code gives noErr for success, and paramErr
// for a null pointer where none is allowed and for a component or an open instance that is none.
// One thread at a time.
#pragma once

#include <MacTypes.h>

#include <cstddef>

extern "C" {

// Four characters as a number, the first one in the highest byte.
using OSType = UInt32;

// --- Memory handles ---------------------------------------------------------------------------

using Size = long;  // in bytes

// A block of memory through a pointer to the pointer to its bytes.
using Handle = char**;

// A new block of zeros, the caller's; also one of no bytes. Null for a size below 0 and when memory
// is short.
Handle NewHandleClear(Size byteCount);

// Frees a block. Nothing happens for null and for what is no block.
void DisposeHandle(Handle handle);

// 0 for null and for what is no block.
Size GetHandleSize(Handle handle);

// --- Components -------------------------------------------------------------------------------

struct ComponentRecord;
using Component = ComponentRecord*;

struct ComponentInstanceRecord;
using ComponentInstance = ComponentInstanceRecord*;

// What a component is, or which ones are looked for.
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

// The first component behind `previous` (null: the first of all) that is like `looking`. Null when
// there is none, for null and for a `previous` that is no component.
Component FindNextComponent(Component previous, ComponentDescription* looking);

// Fills the description in. The three handles must be null: no component has a name, an information
// text or an icon.
OSErr GetComponentInfo(Component component, ComponentDescription* description, Handle name,
                       Handle info, Handle icon);

// A new instance, the caller's to close; null beside every result but noErr. memFullErr.
OSErr OpenAComponent(Component component, ComponentInstance* instance);

OSErr CloseComponent(ComponentInstance instance);

// --- Movie export -----------------------------------------------------------------------------

using ComponentResult = SInt32;
using MovieExportComponent = ComponentInstance;
using UnsignedFixed = UInt32;  // 16 bits before the point, 16 behind it

// The general form of every medium's description; only passed on here.
struct SampleDescription;
using SampleDescriptionHandle = SampleDescription**;

// How sound is stored, in the layout of the published movie file format, in this machine's byte
// order.
struct SoundDescription {
  SInt32 descSize;      // of all this, in bytes
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

// Tells an exporter the sound that it will be given, as a block that holds a SoundDescription; the
// block stays the caller's. paramErr for another size or medium than a sound description's, for no
// channels, a rate of 0, or a sample size of 0 in an uncompressed format; badFormat for a format
// that the file cannot hold. What was told before holds unless the result is noErr.
ComponentResult MovieExportSetSampleDescription(MovieExportComponent exporter,
                                                SampleDescriptionHandle description,
                                                OSType mediaType);

using QTAtomContainer = Handle;

// The exporter's settings for the sound that it was told, as a new block, the caller's; null beside
// every result but noErr. paramErr when it was told none; memFullErr.
ComponentResult MovieExportGetSettingsAsAtomContainer(MovieExportComponent exporter,
                                                      QTAtomContainer* settings);
}
