#pragma once

#include <cairo.h>
#include <fontconfig/fontconfig.h>
#include <pango/pangocairo.h>
#include <pango/pangofc-font.h>

/// The drawing library: Cairo for coverage, Pango with fontconfig for text. Bound by name at run
/// time, so that a machine without them lacks drawing alone, and jobs that do not draw never pay
/// for loading them. Its headers are needed to build, for the types.
namespace zm::platform {

// clang-format off
#define ZM_DRAWING_FUNCTIONS(F)           \
    F(cairo_clip)                         \
    F(cairo_close_path)                   \
    F(cairo_create)                       \
    F(cairo_destroy)                      \
    F(cairo_fill)                         \
    F(cairo_font_options_create)          \
    F(cairo_font_options_destroy)         \
    F(cairo_font_options_set_antialias)   \
    F(cairo_font_options_set_hint_metrics) \
    F(cairo_font_options_set_hint_style)  \
    F(cairo_identity_matrix)              \
    F(cairo_image_surface_create_for_data) \
    F(cairo_line_to)                      \
    F(cairo_move_to)                      \
    F(cairo_new_path)                     \
    F(cairo_set_antialias)                \
    F(cairo_set_dash)                     \
    F(cairo_set_fill_rule)                \
    F(cairo_set_line_cap)                 \
    F(cairo_set_line_join)                \
    F(cairo_set_line_width)               \
    F(cairo_set_matrix)                   \
    F(cairo_set_miter_limit)              \
    F(cairo_set_source_rgba)              \
    F(cairo_status)                       \
    F(cairo_stroke)                       \
    F(cairo_surface_destroy)              \
    F(cairo_surface_flush)                \
    F(FcPatternGetBool)                   \
    F(g_object_unref)                     \
    F(pango_attr_insert_hyphens_new)      \
    F(pango_attr_list_insert)             \
    F(pango_attr_list_new)                \
    F(pango_attr_list_unref)              \
    F(pango_attr_strikethrough_new)       \
    F(pango_attr_underline_new)           \
    F(pango_cairo_context_set_font_options) \
    F(pango_cairo_font_map_new)           \
    F(pango_cairo_font_map_set_resolution) \
    F(pango_cairo_layout_line_path)       \
    F(pango_cairo_show_layout_line)       \
    F(pango_context_get_metrics)          \
    F(pango_context_set_base_dir)         \
    F(pango_context_set_round_glyph_positions) \
    F(pango_fc_font_get_pattern)          \
    F(pango_font_description_free)        \
    F(pango_font_description_new)         \
    F(pango_font_description_set_absolute_size) \
    F(pango_font_description_set_family)  \
    F(pango_font_description_set_style)   \
    F(pango_font_description_set_weight)  \
    F(pango_font_map_create_context)      \
    F(pango_font_map_load_font)           \
    F(pango_font_metrics_get_ascent)      \
    F(pango_font_metrics_get_descent)     \
    F(pango_font_metrics_get_height)      \
    F(pango_font_metrics_unref)           \
    F(pango_layout_get_line_count)        \
    F(pango_layout_get_line_readonly)     \
    F(pango_layout_line_get_extents)      \
    F(pango_layout_new)                   \
    F(pango_layout_set_attributes)        \
    F(pango_layout_set_auto_dir)          \
    F(pango_layout_set_font_description)  \
    F(pango_layout_set_text)              \
    F(pango_layout_set_width)             \
    F(pango_layout_set_wrap)
// clang-format on

/// Its functions under their own names.
struct TDrawingLibrary {
#define ZM_DECLARE_FUNCTION(name) decltype(&::name) name = nullptr;
    ZM_DRAWING_FUNCTIONS(ZM_DECLARE_FUNCTION)
#undef ZM_DECLARE_FUNCTION
};

/// Loads the library on the first call, which may come from any thread; nil where it is missing.
/// It stays for the life of the process: its type system cannot be unloaded.
const TDrawingLibrary* LoadDrawingLibrary();

}  // namespace zm::platform
