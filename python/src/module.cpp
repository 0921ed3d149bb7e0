// SPDX-License-Identifier: MIT
// The extension module netfloor._netfloor. What users see is in netfloor/*.py.
#include "module.h"

#include "netfloor-capture/errors.h"
#include "netfloor-host/condition.h"
#include "netfloor-host/plugin_library.h"

namespace nb = nanobind;

namespace netfloor::python {
namespace {

// Raises a class of netfloor._errors.
template <typename... Parts>
void raise(const char *name, Parts... parts) {
    const nb::object error = nb::module_::import_("netfloor._errors").attr(name)(parts...);
    PyErr_SetObject(error.type().ptr(), error.ptr());
}

void translate(const std::exception_ptr &thrown, void * /*unused*/) {
    try {
        std::rethrow_exception(thrown);
    } catch (const CaptureDamage &error) {
        raise("CaptureDamage", error.what(), error.packetNumber(), error.position());
    } catch (const CaptureError &error) {
        raise("CaptureError", error.what());
    } catch (const ConditionError &error) {
        raise("ConditionError", error.what(), error.place(), error.length());
    } catch (const PluginError &error) {
        raise("PluginError", error.what());
    }
}

} // namespace
} // namespace netfloor::python

NB_MODULE(_netfloor, module) {
    nb::register_exception_translator(&netfloor::python::translate);
    netfloor::python::addShards(module);
    netfloor::python::addScan(module);
    netfloor::python::addPackets(module);
}
