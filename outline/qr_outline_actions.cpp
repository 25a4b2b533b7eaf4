// The eight shared action tables of the outline rows.
#include "outline/qr_outline_actions.h"

#include "outline/qr_outline_object.h"

namespace {

template <void (QR_OutlineObject::*Operation)()>
constexpr QR_ActionOperation rowCall = &QR_ActionCall<QR_OutlineObject, Operation>;

QR_CompiledActions* compile(const QR_ActionSpec* specs, std::uint32_t count) {
  return new QR_CompiledActions(specs, count);
}

}  // namespace

const QR_OutlineTables& QR_outlineTables() {
  // Built once and never freed: every row of every outline refers to them for the whole run.
  static const QR_OutlineTables tables = [] {
    static const QR_ActionSpec expand[] = {
        {QR_OutlineExpand, rowCall<&QR_OutlineObject::expand>},
        {QR_OutlineExpandCollapse, rowCall<&QR_OutlineObject::expand_collapse>},
    };
    static const QR_ActionSpec collapse[] = {
        {QR_OutlineCollapse, rowCall<&QR_OutlineObject::collapse>},
        {QR_OutlineExpandCollapse, rowCall<&QR_OutlineObject::expand_collapse>},
    };
    static const QR_ActionSpec expandAll[] = {
        {QR_OutlineExpandAll, rowCall<&QR_OutlineObject::expand_all>},
    };
    static const QR_ActionSpec collapseAll[] = {
        {QR_OutlineCollapseAll, rowCall<&QR_OutlineObject::collapse_all>},
    };
    static const QR_ActionSpec collapseChildren[] = {
        {QR_OutlineCollapseChildren, rowCall<&QR_OutlineObject::collapse_children>},
    };
    static const QR_ActionSpec next[] = {
        {QR_OutlineNext, rowCall<&QR_OutlineObject::select_next>},
        {QR_OutlineNextSameLevel, rowCall<&QR_OutlineObject::select_next_same_level>},
    };
    static const QR_ActionSpec previous[] = {
        {QR_OutlinePrevious, rowCall<&QR_OutlineObject::select_previous>},
        {QR_OutlinePreviousSameLevel, rowCall<&QR_OutlineObject::select_previous_same_level>},
    };
    static const QR_ActionSpec select[] = {
        {QR_OutlineSelect, rowCall<&QR_OutlineObject::select>},
        {QR_OutlineFirst, rowCall<&QR_OutlineObject::select_first>},
        {QR_OutlineLast, rowCall<&QR_OutlineObject::select_last>},
        {QR_OutlineToTop, rowCall<&QR_OutlineObject::to_top>},
        {QR_OutlineMakeVisible, rowCall<&QR_OutlineObject::make_visible>},
    };
    QR_OutlineTables t{};
    t.expand = compile(expand, 2);
    t.collapse = compile(collapse, 2);
    t.expand_all = compile(expandAll, 1);
    t.collapse_all = compile(collapseAll, 1);
    t.collapse_children = compile(collapseChildren, 1);
    t.next = compile(next, 2);
    t.previous = compile(previous, 2);
    t.select = compile(select, 5);
    t.select_atom = QR_ActionAtom(QR_OutlineSelect);
    return t;
  }();
  return tables;
}
