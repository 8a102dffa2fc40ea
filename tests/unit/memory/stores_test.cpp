// Registrations and name lists without memory.
#include "memory/withoutmemory.h"

#include <utility>

using harness::HarnessAllocations;
using unit::kInterfaceList;
using unit::Names;
using VORN::OVS::OVSIfsConf;
using VORN::OVS::OVSRegConf;

using unit::AsInt;
using unit::Entry;
using unit::kClient;
using unit::kInterface;
using unit::kLongName;
using unit::kModes;
using unit::kOther;
using unit::NameOfRow;
using unit::On;
using unit::WithoutMemory;

namespace {

OVSIfsConf MakeList()
{
    const HarnessAllocations guard;
    return OVSIfsConf(kInterfaceList);
}

std::vector<Entry> Queries()
{
    return {
        {"IsRegister", [] { return VORN::OVS::IsRegister(kClient); }, 0, {-1}},
        {"GetAllRegister",
         [] {
             Names names;
             const int count = VORN::OVS::GetAllRegister(names);
             const HarnessAllocations guard;
             EXPECT_EQ(static_cast<std::size_t>(count), names.size());
             return count;
         },
         1,
         {0}},
        {"IsOVSRunning", [] { return AsInt(VORN::OVS::IsOVSRunning()); }, 1, {0}},
        {"IsInterfaceExist", [] { return AsInt(VORN::OVS::IsInterfaceExist(kInterface)); }, 1, {0}},
        {"OVSSetDefault",
         [] {
             VORN::OVS::OVSSetDefault();
             return 0;
         },
         0,
         {0}},
    };
}

std::vector<Entry> Registrations()
{
    return {
        {"RegisterFirst",
         [] {
             {
                 const HarnessAllocations guard;
                 unit::RenewFolders();
             }
             return VORN::OVS::Register(kClient, kModes);
         },
         0,
         {0, -1}},
        {"RegisterSecond", [] { return VORN::OVS::Register(kOther, kModes); }, 0, {0, -1}},
        {"RegisterAgain", [] { return VORN::OVS::Register(kClient, kModes); }, 1, {0, -1}},
        {"UnRegisterLast", [] { return VORN::OVS::UnRegister(kClient, kModes); }, 0, {0, -1}},
        {"UnRegisterUnknown", [] { return VORN::OVS::UnRegister(kOther, kModes); }, 1, {-1}},
    };
}

std::vector<Entry> Stores()
{
    return {
        {"OVSRegConfLoad",
         On<OVSRegConf>([](OVSRegConf& s) { return s.LoadFromConfig(); }),
         0,
         {-1}},
        {"OVSRegConfRegister",
         On<OVSRegConf>([](OVSRegConf& s) { return s.Register(kOther); }),
         0,
         {-1}},
        {"OVSRegConfUnRegister",
         [] {
             OVSRegConf store;
             {
                 const HarnessAllocations guard;
                 (void)store.LoadFromConfig();
                 (void)store.Register(kOther);
             }
             return store.UnRegister(kOther);
         },
         0,
         {-1}},
        {"OVSRegConfGetRegNames",
         [] {
             OVSRegConf store;
             {
                 const HarnessAllocations guard;
                 (void)store.LoadFromConfig();
             }
             Names names;
             return store.GetRegNames(names);
         },
         1,
         {-1}},
    };
}

std::vector<Entry> Lists()
{
    return {
        {"OVSIfsConf",
         [] {
             std::string path;
             {
                 const HarnessAllocations guard;
                 path = kInterfaceList;
             }
             const OVSIfsConf list(std::move(path));
             return 0;
         },
         0,
         {0}},
        {"OVSIfsConfLoad",
         [] {
             OVSIfsConf list = MakeList();
             return list.LoadFromConfig();
         },
         0,
         {-1}},
        {"OVSIfsConfWrite",
         [] {
             OVSIfsConf list = MakeList();
             return list.Write(kLongName);
         },
         0,
         {-1}},
        {"OVSIfsConfRemove",
         [] {
             OVSIfsConf list = MakeList();
             return list.Remove("eth0");
         },
         0,
         {-1}},
        {"OVSIfsConfWriteToConfig",
         [] {
             const OVSIfsConf list = MakeList();
             Names names;
             {
                 const HarnessAllocations guard;
                 names = {"eth0", kLongName};
             }
             return list.WriteToConfig(names);
         },
         0,
         {-1}},
    };
}

INSTANTIATE_TEST_SUITE_P(Queries, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Queries()), testing::Bool()),
                         NameOfRow);
INSTANTIATE_TEST_SUITE_P(Registrations, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Registrations()), testing::Bool()),
                         NameOfRow);
INSTANTIATE_TEST_SUITE_P(Stores, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Stores()), testing::Bool()), NameOfRow);
INSTANTIATE_TEST_SUITE_P(Lists, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Lists()), testing::Bool()), NameOfRow);

} // namespace
