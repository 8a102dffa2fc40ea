// Does a factory reset of the library's state and nothing else.
#include <vornovs/vornovs.h>

int main()
{
    VORN::OVS::OVSSetDefault();
    return 0;
}
