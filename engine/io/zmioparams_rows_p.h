#pragma once

#include <type_traits>
#include <utility>

#include "engine/io/zmioparams_fields_p.h"
#include "engine/io/zmioparams_types_p.h"

/// How the rows of the list of fields are written.
namespace zm {

/// The parameters object itself, for rows whose value is no single field.
inline void* WholeParams(TIOParams& params) {
    return &params;
}

template <auto kMember>
void* AddressOf(TIOParams& params) {
    return &(params.*kMember);
}

template <auto kMember>
using TTypeOf = std::remove_cvref_t<decltype(std::declval<TIOParams&>().*kMember)>;

}  // namespace zm

// The name of a field is written once: its key and its row in the documentation are made of it.
#define ZM_FIELD_ROW(field, key, since, use, changed)                                             \
    {                                                                                             \
#field, key, &kFieldType < TTypeOf < &TIOParams::field>>, AddressOf < &TIOParams::field>, \
            since, use, changed                                                                   \
    }
