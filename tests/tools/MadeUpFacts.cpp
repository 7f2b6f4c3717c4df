#include "MadeUpFacts.h"

#include "runtime/PlatformSelection.h"

info::Facts workingFacts(const char* vendor, OpenCLProvider provider)
{
    info::Facts facts;
    facts.renderer.usable = facts.renderer.syncObjects = true;
    facts.renderer.renderer = "Maker's GPU";
    facts.renderer.adapterVendorId = 0x8086;
    facts.loader.loaded = true;
    facts.wantedVendor = vendor;

    info::Device device;
    device.name = "GPU 1";
    device.driverVersion = "1.0";
    device.type = CL_DEVICE_TYPE_GPU;
    device.vendorId = 0x8086;
    device.sharesWithRenderer = device.drivesRenderer = device.chosen = true;
    info::Platform platform;
    platform.vendor = vendor;
    platform.name = "Platform 1";
    platform.version = "OpenCL 3.0";
    platform.extensions = "cl_khr_gl_sharing cl_khr_gl_event";
    platform.chosen = true;
    platform.devices = {device};
    facts.platforms = {platform};

    info::StartUp& startUp = facts.startUp;
    startUp.attempted = startUp.valid = true;
    startUp.hasDevice = startUp.hasContext = startUp.hasQueue = true;
    startUp.vendorId = 0x8086;
    startUp.output = "Device is available.\n\n";
    startUp.provider = provider;
    startUp.graphicsToCL = TopenCLInfo::kGraphicsToCLImplicit;
    startUp.clToGraphics = TopenCLInfo::kCLToGraphicsImplicit;
    startUp.doublePrecision = true;
    return facts;
}

info::Facts intelFacts()
{
    return workingFacts(kIntelVendor, kIntelProvider);
}

info::Facts nvidiaFacts(const char* driverVersion)
{
    info::Facts facts = workingFacts(kNVIDIAVendor, kNVIDIAProvider);
    facts.platforms[0].devices[0].driverVersion = driverVersion;
    return facts;
}
