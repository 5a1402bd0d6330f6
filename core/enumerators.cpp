#include "core/enumerators.h"

#include "core/bstr_order.h"

namespace tav {

void BstrTraits::Sort(BSTR* begin, BSTR* end, LONG mode) noexcept {
    MergeExchangeSort(begin, static_cast<size_t>(end - begin),
                      [mode](BSTR a, BSTR b) { return BstrOutOfOrder(a, b, mode); });
}

bool BstrTraits::Passes(const BSTR& text, LONG mode) noexcept { return BstrPassesFilter(text, mode); }

template class EnumeratorObject<AutoConditionTraits>;
template class EnumeratorObject<AutoCondition2Traits>;
template class EnumeratorObject<StorageDeviceTraits>;
template class EnumeratorObject<StorageDevice2Traits>;
template class EnumeratorObject<PscUnitTraits>;
template class EnumeratorObject<SlotTraits>;
template class EnumeratorObject<BstrTraits>;

}  // namespace tav
