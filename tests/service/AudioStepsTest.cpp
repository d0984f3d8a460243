// The steps of a request for export settings, against a fake component host that can lack a
// component, fail, or return any handle. Memory handles are the platform's own.
#include <QuickTime/QuickTime.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>
#include <string>
#include <vector>

#include "service/AudioCommands.h"
#include "service/Commands.h"
#include "service/Request.h"
#include "support/OwnedByCallers.h"
#include "support/Pipe.h"
#include "support/Wire.h"

namespace {

// What the fake host has and returns.
struct Script {
  bool hasExporter = true;
  OSErr info = noErr;
  OSErr open = noErr;
  ComponentResult description = noErr;
  ComponentResult settings = noErr;
  Handle left = nullptr;  // what MovieExportGetSettingsAsAtomContainer stores as the settings
};
Script gScript;

// What the host was asked.
struct Asked {
  std::vector<std::string> calls;
  ComponentDescription looking;
  std::string description;  // the bytes of the block
  OSType mediaType;
};
Asked gAsked;

// Their addresses serve as the component and the instance.
char gExporter;
char gInstance;

Component TheExporter() {
  return reinterpret_cast<Component>(&gExporter);
}
ComponentInstance TheInstance() {
  return reinterpret_cast<ComponentInstance>(&gInstance);
}

}  // namespace

Component FindNextComponent(Component previous, ComponentDescription* looking) {
  gAsked.calls.emplace_back(previous == nullptr ? "find" : "find further");
  gAsked.looking = *looking;
  return gScript.hasExporter ? TheExporter() : nullptr;
}

OSErr GetComponentInfo(Component component, ComponentDescription* description, Handle name,
                       Handle info, Handle icon) {
  const bool asExpected = component == TheExporter() && description != nullptr && name == nullptr &&
                          info == nullptr && icon == nullptr;
  gAsked.calls.emplace_back(asExpected ? "info" : "info with other arguments");
  return gScript.info;
}

OSErr OpenAComponent(Component component, ComponentInstance* instance) {
  gAsked.calls.emplace_back(component == TheExporter() ? "open" : "open another");
  if (gScript.open == noErr) *instance = TheInstance();
  return gScript.open;
}

OSErr CloseComponent(ComponentInstance instance) {
  gAsked.calls.emplace_back(instance == TheInstance() ? "close" : "close another");
  return noErr;
}

ComponentResult MovieExportSetSampleDescription(MovieExportComponent exporter,
                                                SampleDescriptionHandle description,
                                                OSType mediaType) {
  gAsked.calls.emplace_back(exporter == TheInstance() ? "describe" : "describe to another");
  const auto block = reinterpret_cast<Handle>(description);
  gAsked.description.assign(*block, static_cast<std::size_t>(GetHandleSize(block)));
  gAsked.mediaType = mediaType;
  return gScript.description;
}

ComponentResult MovieExportGetSettingsAsAtomContainer(MovieExportComponent exporter,
                                                      QTAtomContainer* settings) {
  gAsked.calls.emplace_back(exporter == TheInstance() ? "settings" : "settings of another");
  *settings = gScript.left;
  return gScript.settings;
}

namespace tallowmere::test {
namespace {

using testing::ElementsAre;

class AudioSteps : public testing::Test {
 protected:
  AudioSteps() {
    gScript = {};
    gAsked = {};
  }

  // Returns the result for some sound and leaves the settings in mSettings.
  OSStatus Run() {
    return GetAIFFExportSettingsThroughIPC(&mSettings, 0x11223344, 0x55667788, 0x99, 0xAABBCCDD);
  }

  struct Served {
    std::string response;
    int status = 0;
  };

  // Serves one request in a child process whose standard streams are pipes.
  static Served Serve() {
    const auto requests = MakePipe();
    const auto responses = MakePipe();
    const std::string request = ExportSettingsRequest(44100u << 16, 16, 2, "twos");
    EXPECT_EQ(write(requests[1], request.data(), request.size()), ssize_t(request.size()));
    const pid_t child = fork();
    if (child == 0) {
      dup2(requests[0], STDIN_FILENO);
      dup2(responses[1], STDOUT_FILENO);
      _exit(-service::ServeOneRequest());
    }
    close(requests[0]);
    close(requests[1]);
    close(responses[1]);
    Served served;
    char byte = 0;
    while (read(responses[0], &byte, 1) == 1) served.response.push_back(byte);
    close(responses[0]);
    int status = 0;
    waitpid(child, &status, 0);
    served.status = WIFEXITED(status) ? -WEXITSTATUS(status) : -1000;
    return served;
  }

  // Starts as a handle to no block, which the request has to replace.
  char* mBytes = nullptr;
  Handle mSettings = &mBytes;
};

TEST_F(AudioSteps, TheExporterIsLookedForByItsCodesWithoutFlags) {
  EXPECT_EQ(Run(), 0);
  EXPECT_EQ(gAsked.looking.componentType, 0x73706974u);
  EXPECT_EQ(gAsked.looking.componentSubType, 0x41494646u);
  EXPECT_EQ(gAsked.looking.componentManufacturer, 0x736F756Eu);
  EXPECT_EQ(gAsked.looking.componentFlags, 0u);
  EXPECT_EQ(gAsked.looking.componentFlagsMask, 0u);
}

TEST_F(AudioSteps, TheDescriptionHas36BytesAndTheRequestsFieldsAtTheirPlaces) {
  EXPECT_EQ(Run(), 0);
  const std::string expected = U32(36) + U32(0xAABBCCDD) + std::string(16, '\0') + U16(0x99) +
                               U16(0x7788) + std::string(4, '\0') + U32(0x11223344);
  EXPECT_EQ(gAsked.description, expected);
  EXPECT_EQ(gAsked.mediaType, 0x736F756Eu);
}

TEST_F(AudioSteps, SuccessGivesTheExportersBlockAndLeavesTheInstanceOpen) {
  gScript.left = NewHandleWith("settings");
  const auto handles = LiveHandles();
  EXPECT_EQ(Run(), 0);
  EXPECT_EQ(mSettings, gScript.left);
  EXPECT_THAT(gAsked.calls, ElementsAre("find", "info", "open", "describe", "settings"));
  EXPECT_EQ(LiveHandles(), handles);
}

TEST_F(AudioSteps, WithoutAnExporterTheResultIsMinus2005) {
  gScript.hasExporter = false;
  EXPECT_EQ(Run(), -2005);
  EXPECT_EQ(mSettings, nullptr);
  EXPECT_THAT(gAsked.calls, ElementsAre("find"));
}

TEST_F(AudioSteps, WithoutInformationNothingIsOpened) {
  gScript.info = -3000;
  EXPECT_EQ(Run(), -3000);
  EXPECT_EQ(mSettings, nullptr);
  EXPECT_THAT(gAsked.calls, ElementsAre("find", "info"));
}

TEST_F(AudioSteps, AnInstanceThatCannotBeOpenedIsNotClosed) {
  gScript.open = -108;
  EXPECT_EQ(Run(), -108);
  EXPECT_EQ(mSettings, nullptr);
  EXPECT_THAT(gAsked.calls, ElementsAre("find", "info", "open"));
}

TEST_F(AudioSteps, ARefusedDescriptionIsDisposedOfAndItsInstanceClosed) {
  const auto handles = LiveHandles();
  gScript.description = -206;
  EXPECT_EQ(Run(), -206);
  EXPECT_EQ(mSettings, nullptr);
  EXPECT_THAT(gAsked.calls, ElementsAre("find", "info", "open", "describe", "close"));
  EXPECT_EQ(LiveHandles(), handles);
}

TEST_F(AudioSteps, SettingsThatFailLeaveTheInstanceOpen) {
  gScript.settings = -50;
  EXPECT_EQ(Run(), -50);
  EXPECT_THAT(gAsked.calls, ElementsAre("find", "info", "open", "describe", "settings"));
}

TEST_F(AudioSteps, AResultOf32BitsCountsByItsLow16Bits) {
  gScript.settings = static_cast<ComponentResult>(0x80018002);
  EXPECT_EQ(Run(), -32766);
  gScript.description = static_cast<ComponentResult>(0x80018003);
  EXPECT_EQ(Run(), -32765);
}

TEST_F(AudioSteps, ATruncatedRequestCallsNothingOfTheHost) {
  const std::string fields = ExportSettingsRequest(44100u << 16, 16, 2, "twos").substr(2);
  for (std::size_t length = 0; length < fields.size(); ++length) {
    const auto ends = MakePipe();
    EXPECT_EQ(write(ends[1], fields.data(), length), ssize_t(length));
    close(ends[1]);
    service::Channel channel(ends[0], -1);
    service::GetAIFFExportSettings(channel);
    close(ends[0]);
    EXPECT_TRUE(channel.Failed()) << length;
    EXPECT_THAT(gAsked.calls, testing::IsEmpty()) << length;
  }
}

TEST_F(AudioSteps, WithoutAnExporterTheResponseIsTheCodeSize0AndTheTrailer) {
  gScript.hasExporter = false;
  const Served served = Serve();
  EXPECT_EQ(served.response, I16(-2005) + std::string("\0\0\0\0MWLT", 8));
  EXPECT_EQ(served.status, 0);
}

TEST_F(AudioSteps, ABlockIsSentByteForByte) {
  const std::string bytes("\0settings\xFF\0", 11);
  gScript.left = NewHandleWith(bytes);
  const Served served = Serve();
  EXPECT_EQ(served.response, I16(0) + U32(11) + bytes + "MWLT");
  EXPECT_EQ(served.status, 0);
}

TEST_F(AudioSteps, ABlockBeyondThePipesCapacityIsSentWhole) {
  std::string bytes;
  for (unsigned i = 0; i < 300'000; ++i) bytes.push_back(static_cast<char>(i * i >> 7));
  gScript.left = NewHandleWith(bytes);
  const Served served = Serve();
  EXPECT_TRUE(served.response == I16(0) + U32(300'000) + bytes + "MWLT");
  EXPECT_EQ(served.status, 0);
}

TEST_F(AudioSteps, ABlockOfNoBytesIsSize0) {
  gScript.left = NewHandleClear(0);
  const Served served = Serve();
  EXPECT_EQ(served.response, I16(0) + std::string("\0\0\0\0MWLT", 8));
  EXPECT_EQ(served.status, 0);
}

TEST_F(AudioSteps, ABlockLeftByAFailingCallIsSentWithItsCode) {
  gScript.settings = -50;
  gScript.left = NewHandleWith("left");
  const Served served = Serve();
  EXPECT_EQ(served.response, I16(-50) + U32(4) + "leftMWLT");
  EXPECT_EQ(served.status, 0);
}

TEST_F(AudioSteps, ABlockWithoutItsBytesFailsTheChannelAfterTheSize) {
  gScript.left = NewHandleWith("gone");
  *gScript.left = nullptr;
  const Served served = Serve();
  EXPECT_EQ(served.response, I16(0) + U32(4));
  EXPECT_EQ(served.status, -36);
}

}  // namespace
}  // namespace tallowmere::test
