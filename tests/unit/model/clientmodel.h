/**
 * What a client of the library is entitled to expect: a few maps that each successful call changes.
 */
#ifndef VORNOVS_TESTS_UNIT_CLIENTMODEL_H
#define VORNOVS_TESTS_UNIT_CLIENTMODEL_H

#include "model/simulatedhost.h"

namespace unit {

struct ClientModel {
    struct Bond {
        int mode;
        std::vector<std::string> slaves;
    };

    Names clients;
    Names ignored;
    /** The interfaces on the switch, and the bonds there by their name such as "ovs_bond0". */
    Names onSwitch;
    std::map<std::string, Bond> bonds;
    /** Client's ports by bridge, and tags by interface or bond. */
    std::map<std::string, Names> ports;
    std::map<std::string, std::string> tags;
    std::map<std::string, SimulatedHost::LinuxBond> linuxBonds;
    std::map<std::string, SimulatedHost::LinuxVlan> linuxVlans;
    Names interfaces;

    [[nodiscard]] std::string BondOf(const std::string& interface) const;
    /** The bridges that live: of interfaces that are no slaves, and of bonds. */
    [[nodiscard]] std::vector<std::string> Bridges() const;
    /** The interfaces that have a live bridge of their own. */
    [[nodiscard]] std::vector<std::string> Bridged() const;

    void ConvertAll();
    void ConvertAllBack();
    void MakeBond(const std::string& name, int mode, const std::vector<std::string>& slaves);
    void DropBond(const std::string& name);
    void TakeOff(const std::string& interface);
    void PutOn(const std::string& interface);

    /** The test fails unless files, lists, kernel and switch are as the model has them. */
    void ExpectAgreement(const SimulatedHost& host) const;

private:
    void ExpectLists() const;
    void ExpectFiles() const;
};

} // namespace unit

#endif
