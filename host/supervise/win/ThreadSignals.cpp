#include "supervise/ThreadSignals.h"

namespace assay_host {

class SignalBlock::Platform {};

SignalBlock::SignalBlock() = default;
SignalBlock::~SignalBlock() = default;

} // namespace assay_host
