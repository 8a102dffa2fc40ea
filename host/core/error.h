/**
 * The platform's last error.
 */
#ifndef VORNHOST_CORE_ERROR_H
#define VORNHOST_CORE_ERROR_H

extern "C" {

/**
 * Gives what VLIBCErrSetEx() recorded last in this thread.
 * @param file  receives the source file's name, cut to 255 bytes; owned by the platform, until the
 *              thread's next error. May be null, as may the line.
 * @return the code, 0 when there was no error.
 */
int VLIBCErrGetEx(const char** file, int* line);
}

#endif
