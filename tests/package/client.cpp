#include <vornovs/vornovs.h>
#include <cstdio>

int main()
{
    VORN::OVS::Register("my-service", {});         // first client: the host goes on to the switch
    std::puts(VORN::OVS::IsRegister("my-service") == 0 ? "on the switch" : "see the system log");
    std::getchar();                                // serve until Enter is pressed
    return VORN::OVS::UnRegister("my-service", {}); // last client: plain Linux networking again
}
