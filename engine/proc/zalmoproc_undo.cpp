// Undo and redo of TZalmoProc. A state is a copy of the whole image, in memory or in a temporary
// file of its own.

#include <limits>
#include <utility>

#include "engine/proc/zalmoproc.h"

namespace zm {

// The store.

void TZmUndoStore::Add(std::unique_ptr<TZmBitmap> object, TZmUndoSource source,
                       std::int32_t operation, std::int32_t mview_index) {
    TZmUndoStoreInfo info;
    info.Source = source;
    info.Operation = operation;
    info.MViewIndex = mview_index;
    fInfoList.push_back(std::move(info));
    fObjectList.push_back(std::move(object));
}

std::unique_ptr<TZmBitmap> TZmUndoStore::ClearAt(std::int32_t index, bool free_undo_image) {
    std::unique_ptr<TZmBitmap> object = std::move(fObjectList.at(static_cast<std::size_t>(index)));
    fObjectList.erase(fObjectList.begin() + index);
    fInfoList.erase(fInfoList.begin() + index);
    if (free_undo_image) {
        object.reset();
    }
    return object;
}

void TZmUndoStore::ClearAll() {
    fObjectList.clear();
    fInfoList.clear();
}

TZmBitmap* TZmUndoStore::GetObject(std::int32_t index) const {
    const bool inside = index >= 0 && index < Count();
    return inside ? fObjectList[static_cast<std::size_t>(index)].get() : nullptr;
}

TZmUndoStoreInfo& TZmUndoStore::GetInfo(std::int32_t index) {
    return fInfoList.at(static_cast<std::size_t>(index));
}

namespace {

/// Index of the item that stands `position` places before the latest; -1 when there is none.
std::int32_t IndexOf(const TZmUndoStore& store, std::int32_t position) {
    return position >= 0 && position < store.Count() ? store.Count() - 1 - position : -1;
}

void ClearItem(TZmUndoStore& store, std::int32_t position) {
    if (const std::int32_t index = IndexOf(store, position); index >= 0) {
        store.ClearAt(index, /*free_undo_image=*/true);
    }
}

const TZmUndoStoreInfo* InfoAt(TZmUndoStore& store, std::int32_t position) {
    const std::int32_t index = IndexOf(store, position);
    return index >= 0 ? &store.GetInfo(index) : nullptr;
}

}  // namespace

// Saving.

/// A copy of the image where states are kept; nil when there is nothing to save or no room.
std::unique_ptr<TZmBitmap> TZalmoProc::CopyState(TZmUndoSource source) {
    if (source != zmuImage || fZmBitmap == nullptr || fZmBitmap->GetWidth() <= 1 ||
        fZmBitmap->GetHeight() <= 1) {
        return nullptr;
    }
    auto item = std::make_unique<TZmBitmap>();
    item->SetLocation(fUndoLocation);
    // The smallest size for a file decides between memory and file, whatever the place set.
    item->SetMinFileSize(fUndoLocation == zmFile ? 0 : std::numeric_limits<std::int64_t>::max());
    item->AssignEx(fZmBitmap, /*with_params=*/false);
    return item->IsEmpty() ? nullptr : std::move(item);
}

/// Appends an item, dropping the oldest ones beyond the limit.
void TZalmoProc::StoreItem(TZmUndoStore& store, std::unique_ptr<TZmBitmap> item,
                           const TZmUndoStoreInfo& info) {
    if (item == nullptr || fUndoLimit == 0) {
        return;
    }
    while (store.Count() > 0 && store.Count() >= fUndoLimit) {
        store.ClearAt(0, /*free_undo_image=*/true);
    }
    store.Add(std::move(item), info.Source, info.Operation, fMViewIndex);
    store.GetInfo(store.Count() - 1).Caption = info.Caption;
}

void TZalmoProc::AddUndoItem(TZmUndoStore& store, const std::u16string& caption,
                             TZmUndoSource source, std::int32_t operation) {
    TZmUndoStoreInfo info;
    info.Caption = caption;
    info.Source = source;
    info.Operation = operation;
    StoreItem(store, CopyState(source), info);
}

void TZalmoProc::SaveUndo(TZmUndoSource source, bool clear_redo) {
    SaveUndo(std::u16string(), source, clear_redo, kOperationNone);
}

void TZalmoProc::SaveUndo(const std::u16string& caption, TZmUndoSource source, bool clear_redo,
                          std::int32_t operation) {
    if (fUndoLimit == 0) {
        return;
    }
    AddUndoItem(fUndoList, caption, source, operation);
    if (clear_redo) {
        ClearAllRedo();
    }
    if (fOnSaveUndo) {
        fOnSaveUndo(this, source);
    }
}

void TZalmoProc::SaveUndoCaptioned(const std::u16string& caption, TZmUndoSource source) {
    SaveUndo(caption, source, /*clear_redo=*/true, kOperationNone);
}

void TZalmoProc::SaveRedo(const std::u16string& caption, TZmUndoSource source,
                          std::int32_t operation) {
    if (fUndoLimit != 0) {
        AddUndoItem(fRedoList, caption, source, operation);
    }
}

// Restoring.

/// Brings the other list up to date for a walk to item `index`: each step's item takes the state
/// that the step leaves, the present one first. The items above `index` move, none is copied.
void TZalmoProc::RecordStates(TZmUndoStore& from, TZmUndoStore& to, std::int32_t index) {
    TZmUndoStoreInfo info = from.GetInfo(from.Count() - 1);
    StoreItem(to, CopyState(info.Source), info);
    while (from.Count() - 1 > index) {
        info = from.GetInfo(from.Count() - 2);
        StoreItem(to, from.ClearAt(from.Count() - 1, /*free_undo_image=*/false), info);
    }
}

void TZalmoProc::MoveState(TZmUndoStore& from, TZmUndoStore& to, std::int32_t position,
                           bool record) {
    const std::int32_t index = IndexOf(from, position);
    if (index < 0 || fZmBitmap == nullptr) {
        return;
    }
    if (record) {
        RecordStates(from, to, index);
    }
    fZmBitmap->AssignEx(from.GetObject(index), /*with_params=*/false);
    if (record) {
        from.ClearAt(index, /*free_undo_image=*/true);
    }
    Update();
    if (fOnUndoRedoEvent) {
        fOnUndoRedoEvent(this);
    }
}

void TZalmoProc::UndoAt(std::int32_t position, bool auto_redo) {
    MoveState(fUndoList, fRedoList, position, auto_redo);
}

void TZalmoProc::RedoAt(std::int32_t position, bool auto_undo) {
    MoveState(fRedoList, fUndoList, position, auto_undo);
}

void TZalmoProc::UndoRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2) {
    TZmBitmap* item = fUndoList.GetObject(fUndoList.Count() - 1);
    if (item == nullptr || fZmBitmap == nullptr || x2 < x1 || y2 < y1) {
        return;
    }
    // The far corner is limited first, so that the sizes cannot overflow.
    x1 = x1 < 0 ? 0 : x1;
    y1 = y1 < 0 ? 0 : y1;
    x2 = x2 >= item->GetWidth() ? item->GetWidth() - 1 : x2;
    y2 = y2 >= item->GetHeight() ? item->GetHeight() - 1 : y2;
    if (x2 < x1 || y2 < y1) {
        return;
    }
    item->CopyRectTo(fZmBitmap, x1, y1, x1, y1, x2 - x1 + 1, y2 - y1 + 1, /*copy_alpha=*/true);
    Update();
}

// Lists.

void TZalmoProc::ClearUndo() {
    ClearItem(fUndoList, 0);
}

void TZalmoProc::ClearUndoAt(std::int32_t position) {
    ClearItem(fUndoList, position);
}

const TZmUndoStoreInfo* TZalmoProc::GetUndoInfo(std::int32_t position) {
    return InfoAt(fUndoList, position);
}

void TZalmoProc::ClearRedo() {
    ClearItem(fRedoList, 0);
}

void TZalmoProc::ClearRedoAt(std::int32_t position) {
    ClearItem(fRedoList, position);
}

const TZmUndoStoreInfo* TZalmoProc::GetRedoInfo(std::int32_t position) {
    return InfoAt(fRedoList, position);
}

}  // namespace zm
