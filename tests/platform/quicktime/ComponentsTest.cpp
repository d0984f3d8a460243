// Finding components, and opening and closing instances.
#include <QuickTime/QuickTime.h>
#include <gtest/gtest.h>

#include "support/OwnedByCallers.h"

namespace tallowmere::quicktime::test {
namespace {

using tallowmere::test::OpenInstances;

constexpr OSType kSpit = 0x73706974;
constexpr OSType kAIFF = 0x41494646;
constexpr OSType kSoun = 0x736F756E;
constexpr OSType kOther = 0x6F746872;

Component Find(ComponentDescription looking) {
  return FindNextComponent(nullptr, &looking);
}

Component Exporter() {
  return Find({kSpit, kAIFF, kSoun, 0, 0});
}

TEST(Components, TheExporterIsFoundByItsCodes) {
  EXPECT_NE(Exporter(), nullptr);
}

TEST(Components, AZeroInTheDescriptionStandsForAnyCode) {
  EXPECT_EQ(Find({0, kAIFF, kSoun, 0, 0}), Exporter());
  EXPECT_EQ(Find({kSpit, 0, kSoun, 0, 0}), Exporter());
  EXPECT_EQ(Find({kSpit, kAIFF, 0, 0, 0}), Exporter());
  EXPECT_EQ(Find({}), Exporter());
}

TEST(Components, AnUnknownCodeFindsNoComponent) {
  EXPECT_EQ(Find({kOther, kAIFF, kSoun, 0, 0}), nullptr);
  EXPECT_EQ(Find({kSpit, kOther, kSoun, 0, 0}), nullptr);
  EXPECT_EQ(Find({kSpit, kAIFF, kOther, 0, 0}), nullptr);
}

TEST(Components, FlagsCountOnlyWhereTheMaskHasThem) {
  EXPECT_EQ(Find({kSpit, kAIFF, kSoun, 6, 9}), Exporter());
  EXPECT_EQ(Find({kSpit, kAIFF, kSoun, 6, 10}), nullptr);
}

TEST(Components, ThereIsOneExporter) {
  ComponentDescription looking{kSpit, kAIFF, kSoun, 0, 0};
  EXPECT_EQ(FindNextComponent(Exporter(), &looking), nullptr);
}

TEST(Components, NothingIsFoundForNullOrAfterANonComponent) {
  ComponentDescription looking{};
  EXPECT_EQ(FindNextComponent(nullptr, nullptr), nullptr);
  EXPECT_EQ(FindNextComponent(reinterpret_cast<Component>(&looking), &looking), nullptr);
}

TEST(Components, TheInformationIsTheDescription) {
  ComponentDescription description{1, 2, 3, 4, 5};
  ASSERT_EQ(GetComponentInfo(Exporter(), &description, nullptr, nullptr, nullptr), noErr);
  EXPECT_EQ(description.componentType, kSpit);
  EXPECT_EQ(description.componentSubType, kAIFF);
  EXPECT_EQ(description.componentManufacturer, kSoun);
  EXPECT_EQ(description.componentFlags, 0u);
  EXPECT_EQ(description.componentFlagsMask, 0u);
}

TEST(Components, ThereIsNoInformationWithoutAComponentOrABuffer) {
  ComponentDescription description{};
  EXPECT_EQ(GetComponentInfo(nullptr, &description, nullptr, nullptr, nullptr), -50);
  EXPECT_EQ(GetComponentInfo(Exporter(), nullptr, nullptr, nullptr, nullptr), -50);
}

TEST(Components, AComponentHasNoNameInformationTextOrIcon) {
  const Handle text = NewHandleClear(0);
  ComponentDescription description{};
  EXPECT_EQ(GetComponentInfo(Exporter(), &description, text, nullptr, nullptr), -50);
  EXPECT_EQ(GetComponentInfo(Exporter(), &description, nullptr, text, nullptr), -50);
  EXPECT_EQ(GetComponentInfo(Exporter(), &description, nullptr, nullptr, text), -50);
  EXPECT_EQ(description.componentType, 0u);
  DisposeHandle(text);
}

TEST(Components, AnInstanceIsOpenUntilItIsClosed) {
  const auto before = OpenInstances();
  ComponentInstance first = nullptr;
  ComponentInstance second = nullptr;
  ASSERT_EQ(OpenAComponent(Exporter(), &first), noErr);
  ASSERT_EQ(OpenAComponent(Exporter(), &second), noErr);
  EXPECT_NE(first, second);
  EXPECT_EQ(OpenInstances(), before + 2);
  EXPECT_EQ(CloseComponent(first), noErr);
  EXPECT_EQ(OpenInstances(), before + 1);
  EXPECT_EQ(CloseComponent(second), noErr);
  EXPECT_EQ(OpenInstances(), before);
}

TEST(Components, ANonComponentIsNotOpened) {
  const auto before = OpenInstances();
  ComponentDescription other{};
  ComponentInstance instance = reinterpret_cast<ComponentInstance>(&other);
  EXPECT_EQ(OpenAComponent(nullptr, &instance), -50);
  EXPECT_EQ(instance, nullptr);
  EXPECT_EQ(OpenAComponent(reinterpret_cast<Component>(&other), &instance), -50);
  EXPECT_EQ(OpenAComponent(Exporter(), nullptr), -50);
  EXPECT_EQ(OpenInstances(), before);
}

TEST(Components, AClosedInstanceIsNotClosedAgain) {
  ComponentInstance instance = nullptr;
  ASSERT_EQ(OpenAComponent(Exporter(), &instance), noErr);
  ASSERT_EQ(CloseComponent(instance), noErr);
  EXPECT_EQ(CloseComponent(instance), -50);
  EXPECT_EQ(CloseComponent(nullptr), -50);
}

}  // namespace
}  // namespace tallowmere::quicktime::test
