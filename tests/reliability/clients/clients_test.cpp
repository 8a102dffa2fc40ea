// Every combination of what clients do with their children, signals, descriptors and environment.
#include "clients/served.h"
#include "clients/traits.h"
#include "host/host.h"
#include "support/figures.h"

#include <gtest/gtest.h>

namespace {

using reliability::ChildTraits;
using reliability::DescriptorTraits;
using reliability::EnvironmentTraits;
using reliability::Findings;
using reliability::RunClient;
using reliability::SignalTraits;
using reliability::Trait;

/** A host where another client is registered already. */
void StartWithKeeper()
{
    reliability::StartWith({{"/usr/vorn/etc/vornovs/ovs_reg.conf", "keeper\n"}});
}

std::vector<std::vector<Trait>> Combinations()
{
    std::vector<std::vector<Trait>> combinations;
    for (const Trait& environment : EnvironmentTraits()) {
        for (const Trait& signals : SignalTraits()) {
            for (const Trait& children : ChildTraits()) {
                for (const Trait& descriptors : DescriptorTraits()) {
                    combinations.push_back({environment, signals, children, descriptors});
                }
            }
        }
    }
    return combinations;
}

std::string NameOf(const std::vector<Trait>& traits)
{
    std::string name;
    for (const Trait& trait : traits) {
        name.append(name.empty() ? "" : ", ").append(trait.name);
    }
    return name;
}

TEST(Client, IsServedWhateverItDoesWithItselfOrToldThatItCannotBe)
{
    StartWithKeeper();
    reliability::Plant();
    const std::string withoutDescriptor = DescriptorTraits().back().name;
    int served = 0;
    int refused = 0;
    for (const auto& traits : Combinations()) {
        const bool canBe = traits.back().name != withoutDescriptor;
        EXPECT_EQ(RunClient(traits, canBe ? reliability::ExpectServed : reliability::ExpectRefused),
                  "")
            << NameOf(traits);
        (canBe ? served : refused) += 1;
        EXPECT_EQ(reliability::ReadFile("/usr/vorn/etc/vornovs/ovs_reg.conf"), "keeper\n");
        EXPECT_TRUE(reliability::LockIsFree());
    }
    EXPECT_FALSE(reliability::PlantedRan());
    reliability::Figure(std::to_string(served + refused) + " clients: " + std::to_string(served) +
                        " hostile ones served in full, " + std::to_string(refused) +
                        " without a descriptor refused as documented");
}

TEST(Client, IsServedAgainOnceItHasDescriptorsAgain)
{
    StartWithKeeper();
    EXPECT_EQ(RunClient({},
                        [](Findings& findings) {
                            const auto descriptors = reliability::LeaveDescriptors(0);
                            reliability::ExpectRefused(findings);
                            for (const int descriptor : descriptors) {
                                (void)::close(descriptor);
                            }
                            reliability::ExpectServed(findings);
                        }),
              "");
}

} // namespace
