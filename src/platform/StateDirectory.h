// Platform service: the folder that holds the library's durable state.
//
// The registry store and the event-log store live here. On Windows the system keeps both; on
// POSIX the folder is OWUTILS_STATE_DIR when set, else /var/lib/owutils for root, else
// $XDG_STATE_HOME/owutils, else ~/.local/state/owutils. Tests point OWUTILS_STATE_DIR at a
// temporary folder.
#pragma once

#include <string>

namespace Platform {

// The state folder as a native path in UTF-16, created (mode 0700) when missing. The variable is
// read on every call, so a change of OWUTILS_STATE_DIR takes effect at the next call. Returns
// false with the last error set when the folder cannot be determined or created.
bool GetStateDirectory(std::u16string& path);

}  // namespace Platform
