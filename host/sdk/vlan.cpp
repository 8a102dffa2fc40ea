/**
 * VLAN interfaces. This platform does not take them apart: a VLAN interface goes on to the switch
 * as it is, as the port of a bridge of its own, and comes back the same way. So none is reported
 * as a VLAN, and making or deleting one is refused.
 */
#include <syslog.h>
#include <vornplatform/sdk.h>

int VLIBNetVlanGet(const char* name, _tag_VLIB_VLAN* vlan)
{
    return name == nullptr || vlan == nullptr ? -1 : 0;
}

int VLIBNetVlanCreate(const char* parent, int vlanId, const VORNNETIPCONFIG* /*ipConfig*/)
{
    ::syslog(LOG_ERR, "vornsdk: VLAN %d of %s is not made: this platform carries VLANs as they are",
             vlanId, parent == nullptr ? "no interface" : parent);
    return -1;
}

int VLIBNetVlanRemove(const char* name)
{
    ::syslog(LOG_ERR, "vornsdk: VLAN %s is not deleted: this platform carries VLANs as they are",
             name == nullptr ? "of no name" : name);
    return -1;
}
