/* The handle calls are usable from C. */
#include "tessaline/files/rvFileApi.h"
#include "tessaline/files/rvFileApi.h"

int rvFileApiFromC(const char* path)
{
    unsigned long high = 0;
    void* handle = CreateFile(path, 0, 0, 0, 0, 0, 0);
    if (handle == (void*)-1) {
        return 0;
    }
    GetFileSize(handle, &high);
    return SetFilePointer64(handle, 0, 0) == 0 && CloseHandle(handle);
}
