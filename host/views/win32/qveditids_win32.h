#pragma once

/// Identifiers of the windows in the job editor's windows. Close, Insert and Cancel have those
/// of the system's dialog keys.
namespace zm::qvrun {

inline constexpr int kStepListId = 100;
inline constexpr int kPlaceholderId = 101;
inline constexpr int kAddId = 102;
inline constexpr int kConfigureId = 103;
inline constexpr int kRemoveId = 104;
inline constexpr int kMoveUpId = 105;
inline constexpr int kMoveDownId = 106;
inline constexpr int kHintId = 107;
inline constexpr int kSaveId = 108;
inline constexpr int kVariableListId = 109;
/// Of the menu's entry that adds a step of the first action; the others follow.
inline constexpr int kFirstActionId = 1000;

}  // namespace zm::qvrun
