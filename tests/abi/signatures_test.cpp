// Clients are linked against these very signatures: a changed one fails to compile here.
#include <vornovs/vornovs.h>

#include <vornplatform/core.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

#include <gtest/gtest.h>

#include <cstddef>
#include <type_traits>

namespace {

using namespace VORN::OVS;
using Name = const std::string&;
using Names = std::set<std::string>;
using Map = const std::map<std::string, std::string>&;

template <typename Expected, typename Actual>
constexpr bool kIs = std::is_same_v<Expected, Actual>;

static_assert(kIs<int (*)(Name), decltype(&IsRegister)>);
static_assert(kIs<int (*)(Names&), decltype(&GetAllRegister)>);
static_assert(kIs<bool (*)(), decltype(&IsOVSRunning)>);
static_assert(kIs<int (*)(), decltype(&NotSupportOVS)>);
static_assert(kIs<int (*)(), decltype(&IsOVSSupport)>);
static_assert(kIs<int (*)(Name, Map), decltype(&Register)>);
static_assert(kIs<int (*)(Name, Map), decltype(&UnRegister)>);
static_assert(kIs<void (*)(), decltype(&OVSSetDefault)>);

using Mode = VORN_LINK_AGGR_MODE;
using NameList = std::vector<std::string>;
static_assert(kIs<int (*)(Name), decltype(&RemoveInterface)>);
static_assert(kIs<int (*)(Name), decltype(&AddInterface)>);
static_assert(kIs<int (*)(Names&), decltype(&ListInterface)>);
static_assert(kIs<int (*)(Name, Name), decltype(&AttachPort)>);
static_assert(kIs<int (*)(Name, Name), decltype(&DetachPort)>);

static_assert(kIs<int (*)(Mode, Name, NameList&), decltype(&OVSBondCreate)>);
static_assert(kIs<int (*)(Name, VORNLINKAGGROPT*), decltype(&OVSBondRemove)>);
static_assert(kIs<int (*)(Name, VORNLINKAGGROPT*), decltype(&OVSBondGet)>);
static_assert(kIs<int (*)(Mode, Name), decltype(&OVSBodChMode)>);
static_assert(kIs<Mode (*)(const char*), decltype(&StrToMode)>);
static_assert(kIs<void (*)(Mode, std::string&), decltype(&ModeToStr)>);
static_assert(kIs<bool (*)(Mode), decltype(&CheckModeSupport)>);
static_assert(kIs<int (*)(std::string&), decltype(&GetUniqueBondName)>);

static_assert(kIs<int (*)(Name, _tag_VLIB_VLAN*), decltype(&OVSVlanGet)>);
static_assert(kIs<int (*)(Name, Name), decltype(&OVSVlanSet)>);
static_assert(kIs<int (*)(Name), decltype(&OVSVlanClear)>);
static_assert(kIs<int (*)(Name, Name), decltype(&OVSVlanCreate)>);
static_assert(kIs<int (*)(Name), decltype(&OVSVlanRemove)>);

static_assert(kIs<bool (*)(), decltype(&IsDaemonAlive)>);
static_assert(kIs<bool (*)(), decltype(&StartOVSDaemon)>);
static_assert(kIs<bool (*)(), decltype(&StopOVSBaemon)>);
static_assert(kIs<bool (*)(const NameList&), decltype(&StartNetwork)>);
static_assert(kIs<bool (*)(const NameList&), decltype(&StopNetwork)>);
static_assert(kIs<bool (*)(Name), decltype(&IsInterfaceExist)>);
static_assert(kIs<int (*)(const char*, const char*), decltype(&CopyGatewayInfo)>);
static_assert(kIs<int (*)(const char*), decltype(&RemoveGateWayInfo)>);

static_assert(kIs<int (OVSRegConf::*)(), decltype(&OVSRegConf::LoadFromConfig)>);
static_assert(kIs<int (OVSRegConf::*)(Name), decltype(&OVSRegConf::Register)>);
static_assert(kIs<int (OVSRegConf::*)(Name), decltype(&OVSRegConf::UnRegister)>);
static_assert(kIs<int (OVSRegConf::*)(Name), decltype(&OVSRegConf::IsRegister)>);
static_assert(kIs<int (OVSRegConf::*)(Names&), decltype(&OVSRegConf::GetRegNames)>);
static_assert(kIs<int (OVSRegConf::*)() const, decltype(&OVSRegConf::CheckAndMkdir)>);
static_assert(kIs<int (OVSRegConf::*)() const, decltype(&OVSRegConf::WriteToConfig)>);

static_assert(std::is_constructible_v<OVSIfsConf, std::string>);
static_assert(kIs<int (OVSIfsConf::*)(), decltype(&OVSIfsConf::LoadFromConfig)>);
static_assert(kIs<int (OVSIfsConf::*)(Name), decltype(&OVSIfsConf::Write)>);
static_assert(kIs<int (OVSIfsConf::*)(Name), decltype(&OVSIfsConf::Remove)>);
static_assert(kIs<int (OVSIfsConf::*)(const Names&) const, decltype(&OVSIfsConf::WriteToConfig)>);
static_assert(kIs<int (OVSIfsConf::*)() const, decltype(&OVSIfsConf::CheckAndMkdir)>);

static_assert(std::is_base_of_v<vornnetsdk::hook::BaseHook, OVSChangeHook>);
static_assert(sizeof(OVSChangeHook) == sizeof(vornnetsdk::hook::BaseHook));
static_assert(sizeof(vornnetsdk::hook::BaseHook) == 2 * sizeof(void*));

static_assert(kIs<Mode (*)(Name), decltype(&BondManager::StrToMode)>);
static_assert(kIs<void (*)(Mode, std::string&), decltype(&BondManager::ModeToStr)>);
static_assert(kIs<void (*)(Mode, std::string&), decltype(&BondManager::ModeToBondOPT)>);
static_assert(kIs<bool (*)(Mode), decltype(&BondManager::CheckModeSupport)>);
static_assert(kIs<Mode (*)(Mode), decltype(&BondManager::DefaultModeConvert)>);
static_assert(kIs<bool (*)(Name, VORNLINKAGGROPT*), decltype(&BondManager::Get)>);
static_assert(kIs<bool (*)(Mode, Name), decltype(&BondManager::BondChMode)>);
static_assert(kIs<bool (*)(Mode, Name, NameList&, bool), decltype(&BondManager::Create)>);
static_assert(kIs<bool (*)(Name, VORNLINKAGGROPT*, bool), decltype(&BondManager::Remove)>);
static_assert(kIs<bool (*)(std::string&), decltype(&BondManager::GetUniqueName)>);

static_assert(kIs<int (*)(Name, _tag_VLIB_VLAN*), decltype(&VlanManager::Get)>);
static_assert(kIs<int (*)(Name, Name), decltype(&VlanManager::Set)>);
static_assert(kIs<int (*)(Name), decltype(&VlanManager::Clear)>);
static_assert(kIs<int (*)(Name, Name), decltype(&VlanManager::Create)>);
static_assert(kIs<int (*)(Name), decltype(&VlanManager::Remove)>);

static_assert(kIs<int (OVSManager::*)(), decltype(&OVSManager::GetInterface)>);
static_assert(kIs<int (OVSManager::*)(Names&), decltype(&OVSManager::GetSwitchList)>);
static_assert(kIs<int (OVSManager::*)(Name),
                  decltype(static_cast<int (OVSManager::*)(Name)>(&OVSManager::InitBondOpt))>);
static_assert(
    kIs<int (OVSManager::*)(Name, Name),
        decltype(static_cast<int (OVSManager::*)(Name, Name)>(&OVSManager::InitBondOpt))>);
static_assert(kIs<bool (OVSManager::*)(Name, Name) const, decltype(&OVSManager::AttachPort)>);
static_assert(kIs<bool (OVSManager::*)(Name, Name) const, decltype(&OVSManager::DetachPort)>);
static_assert(kIs<bool (OVSManager::*)(), decltype(&OVSManager::CreateAll)>);
static_assert(kIs<int (OVSManager::*)(Name) const, decltype(&OVSManager::CreateOVS)>);
static_assert(kIs<int (OVSManager::*)(const char*, const char*, const char*, const char*) const,
                  decltype(&OVSManager::CreateOVSForGeneral)>);
static_assert(kIs<int (OVSManager::*)(), decltype(&OVSManager::CreateOVSBond)>);
static_assert(kIs<int (OVSManager::*)() const, decltype(&OVSManager::CreateOVSVlan)>);
static_assert(kIs<int (OVSManager::*)(), decltype(&OVSManager::RemoveLinuxBond)>);
static_assert(kIs<int (OVSManager::*)() const, decltype(&OVSManager::RemoveLinuxVlan)>);
static_assert(kIs<bool (OVSManager::*)(), decltype(&OVSManager::DeleteAll)>);
static_assert(kIs<int (OVSManager::*)(Name) const, decltype(&OVSManager::DestroyOVS)>);
static_assert(kIs<int (OVSManager::*)(), decltype(&OVSManager::RemoveOVSBond)>);
static_assert(kIs<int (OVSManager::*)() const, decltype(&OVSManager::RemoveOVSVlan)>);
static_assert(kIs<int (OVSManager::*)(), decltype(&OVSManager::CreateLinuxBond)>);
static_assert(kIs<int (OVSManager::*)() const, decltype(&OVSManager::CreateLinuxVlan)>);

TEST(Records, LieAtTheOffsetsThatThePlatformUses)
{
    EXPECT_EQ(offsetof(VORNLINKAGGROPT, szMaster), 0U);
    EXPECT_EQ(offsetof(VORNLINKAGGROPT, mode), 16U);
    EXPECT_EQ(offsetof(VORNLINKAGGROPT, nSlave), 24U);
    EXPECT_EQ(offsetof(VORNLINKAGGROPT, rgszSlave), 28U);
    EXPECT_EQ(sizeof(VORNLINKAGGROPT), 540U);
    EXPECT_EQ(offsetof(_tag_VLIB_VLAN, szIfName), 0U);
    EXPECT_EQ(offsetof(_tag_VLIB_VLAN, szRealName), 16U);
    EXPECT_EQ(offsetof(_tag_VLIB_VLAN, vlanId), 32U);
    EXPECT_EQ(sizeof(_tag_VLIB_VLAN), 36U);
    EXPECT_EQ(offsetof(VLIBNETIFINFO, szIfName), 0U);
    EXPECT_EQ(sizeof(VLIBNETIFINFO), 132U);
    EXPECT_EQ(offsetof(VORNNETETHINFO, speed), 0U);
    EXPECT_EQ(sizeof(VORNNETIPCONFIG), 72U);
    EXPECT_EQ(offsetof(VLIBCSzList, nItem), 0U);
}

TEST(Classes, HoldTheirDeclaredMembersAndNothingBesides)
{
    // A virtual table pointer, then the members in their declared order.
    EXPECT_EQ(sizeof(OVSRegConf), sizeof(void*) + sizeof(Names));
    EXPECT_EQ(sizeof(OVSIfsConf), sizeof(void*) + sizeof(std::string) + sizeof(Names));
    EXPECT_EQ(sizeof(OVSManager), sizeof(void*) + sizeof(Names) +
                                      sizeof(std::map<std::string, _tag_VLIB_VLAN>) +
                                      sizeof(std::map<std::string, VORNLINKAGGROPT>));
    EXPECT_EQ(sizeof(BondManager), 1U);
    EXPECT_EQ(sizeof(VlanManager), 1U);
}

TEST(Classes, HaveAVirtualDestructorWhereClientsDeleteThemThroughAPointer)
{
    EXPECT_TRUE(std::has_virtual_destructor_v<OVSRegConf>);
    EXPECT_TRUE(std::has_virtual_destructor_v<OVSIfsConf>);
    EXPECT_TRUE(std::has_virtual_destructor_v<OVSManager>);
    EXPECT_TRUE(std::has_virtual_destructor_v<OVSChangeHook>);
    EXPECT_FALSE(std::is_polymorphic_v<BondManager>);
    EXPECT_FALSE(std::is_polymorphic_v<VlanManager>);
}

} // namespace
