#pragma once

namespace NZEMRUVTAV {

// Asks the user whether to proceed on an unsupported machine, until the answer is "y" or "n" in either case. Returns
// true for "y". The end of the input and a read error count as "n". Leaves the input after the answer to the
// application.
bool UserAgrees();

}  // namespace NZEMRUVTAV
