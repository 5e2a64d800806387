// CEncrypt: file encryption in place and file digests.
#include "owutils/CEncrypt.h"

void CEncrypt::CloseDigestFile() noexcept { m_hFile = INVALID_HANDLE_VALUE; }
