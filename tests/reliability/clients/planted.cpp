// Loaded where nobody wants it.
#include <fcntl.h>
#include <unistd.h>

__attribute__((constructor)) static void LeaveMark()
{
    (void)::close(::open("/tmp/planted/ran", O_WRONLY | O_CREAT | O_CLOEXEC, 0644));
}
