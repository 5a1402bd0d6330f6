#include "module/class_table.h"

#include "TavController.h"

namespace tav {
namespace {

ClassRow classTable[] = {
    {&CLSID_TavController, OLESTR("TavController"), 1},
    {&CLSID_TavController2, OLESTR("TavController2"), 2},
    {&CLSID_TavController3, OLESTR("TavController3"), 3},
    {&CLSID_TavController4, OLESTR("TavController4"), 4},
    {&CLSID_TavController5, OLESTR("TavController5"), 5},
    {&CLSID_TavController6, OLESTR("TavController6"), 6},
    {&CLSID_TavController7, OLESTR("TavController7"), 7},
    {&CLSID_TavController8, OLESTR("TavController8"), 8},
    {&CLSID_TavController9, OLESTR("TavController9"), 9},
    {&CLSID_TavController10, OLESTR("TavController10"), 10},
    {&CLSID_TavController11, OLESTR("TavController11"), 11},
    {&CLSID_TavController12, OLESTR("TavController12"), 12},
    {&CLSID_TavController13, OLESTR("TavController13"), 13},
    {&CLSID_TavController14, OLESTR("TavController14"), 14},
    {&CLSID_TavController15, OLESTR("TavController15"), 15},
    {&CLSID_TavController16, OLESTR("TavController16"), 16},
    {&CLSID_TavController17, OLESTR("TavController17"), 17},
};

}  // namespace

std::span<ClassRow> ClassTable() { return classTable; }

ClassRow* FindClass(REFCLSID clsid) {
    for (ClassRow& row : classTable) {
        if (IsEqualCLSID(clsid, *row.clsid)) {
            return &row;
        }
    }
    return nullptr;
}

}  // namespace tav
