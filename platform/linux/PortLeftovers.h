#pragma once

#include <string>
#include <vector>

namespace platform {

/// The names in an open directory; none when it cannot be read.
std::vector<std::string> EntriesOf(int directory);

/// Removes the files of ports that bore the serial number of a process which has ended: nobody will take such
/// a name again. All others' files stay, for their locks must.
void RemoveLeftovers(int directory);

} // namespace platform
