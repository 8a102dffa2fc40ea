/**
 * Records that the library exchanges with the platform. Their layout is binary interface: the
 * platform fills and reads them at fixed offsets.
 */
#ifndef VORNPLATFORM_RECORDS_H
#define VORNPLATFORM_RECORDS_H

/** Size of a name field: 15 bytes of name and the terminator. */
#define VORN_NAME_SIZE 16
/** Number of slave names that a link-aggregation record holds. */
#define VORN_LINK_AGGR_SLAVES 32

/** Link-aggregation mode: 1 to 5 are the kernel's, 6 to 8 the switch's. */
enum VORN_LINK_AGGR_MODE : int {
    VORN_LINK_AGGR_NONE = 0, /**< no mode; VORNNetLinkAggrSet() takes the bond apart */
    VORN_LINK_AGGR_BALANCE_RR = 1,
    VORN_LINK_AGGR_8023AD = 2,
    VORN_LINK_AGGR_BALANCE_XOR = 3,
    VORN_LINK_AGGR_ACTIVE_BACKUP = 4,
    VORN_LINK_AGGR_BALANCE_ALB = 5,
    VORN_LINK_AGGR_OVS_ACTIVE_BACKUP = 6,
    VORN_LINK_AGGR_OVS_BALANCE_SLB = 7,
    VORN_LINK_AGGR_OVS_BALANCE_TCP = 8
};

/** A link-aggregation group (bond). */
struct VORNLINKAGGROPT {
    char szMaster[VORN_NAME_SIZE]; /**< bond interface name, NUL-terminated, such as "bond0" */
    VORN_LINK_AGGR_MODE mode;
    int reserved; /**< the platform's own */
    int nSlave;   /**< number of valid entries in rgszSlave */
    char rgszSlave[VORN_LINK_AGGR_SLAVES][VORN_NAME_SIZE]; /**< slave interface names */
};

/** A VLAN interface, or the VLAN tag of a switch port. */
struct _tag_VLIB_VLAN {
    char szIfName[VORN_NAME_SIZE];   /**< VLAN interface name; for a switch port its name */
    char szRealName[VORN_NAME_SIZE]; /**< interface that carries the VLAN; for a port its name */
    int vlanId;                      /**< VLAN tag */
};

/** One entry of the list that VLIBNetGetInterfaceInfo() fills. */
struct VLIBNETIFINFO {
    char szIfName[VORN_NAME_SIZE];
    char platformData[116]; /**< the platform's own */
};

/** Ethernet information; only the first field is part of the contract. */
struct VORNNETETHINFO {
    int speed;              /**< link speed in Mbit/s, 0 unknown, -1 while the link is not up */
    char platformData[252]; /**< room for what the platform adds */
};

/** IP configuration of an interface, handed from the platform to the platform unread. */
struct VORNNETIPCONFIG {
    int platformData[18];
};

/** The moment at which a change hook is fired. */
enum _tag_sdk_plugin_action_ : int {
    SDK_PLUGIN_ACTION_BEGIN = 4, /**< a conversion is about to begin */
    SDK_PLUGIN_ACTION_DONE = 5   /**< a conversion has completed */
};

static_assert(sizeof(VORNLINKAGGROPT) == 540, "layout of the bond record is binary interface");
static_assert(sizeof(_tag_VLIB_VLAN) == 36, "layout of the VLAN record is binary interface");
static_assert(sizeof(VLIBNETIFINFO) == 132, "layout of the interface record is binary interface");
static_assert(sizeof(VORNNETIPCONFIG) == 72, "size of the IP configuration is binary interface");

#endif
