#pragma once

namespace tessel {

/// Lets the process live when its bus dies: GIO would end it, whichever library made the connection. Called
/// once, before there is one.
void SurviveBusLoss();

} // namespace tessel
