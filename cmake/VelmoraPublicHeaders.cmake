# The installed interface: the headers a platform layer and a host program include, and nothing
# else. Every header here includes only headers of this list; the install test compiles each one
# on its own against the installed tree. The others (managers, dump copies, the string
# compatibility layer, the tools) stay in the source tree.
set(VELMORA_PUBLIC_HEADERS
    # The seam: what a platform layer defines and what the library calls on it.
    platform/VelmoraExport.h
    platform/VelmoraPlat.h
    platform/PerfExecutor.h
    platform/OnDemandBoostServer.h
    platform/PlatformImports.h
    probe/ProbeClock.h
    # The vocabulary that travels through the seam: tags, fixed command ids, their classes.
    config/Tags.h
    config/CommandIds.h
    config/CommandKind.h
    # The loader and the records it converts.
    config/Action.h
    config/RawXmlData.h
    config/VelmoraLoadXml.h
    config/VelmoraParser.h
    # The host's entry points.
    server/VelmoraServer.h
    # Where trace points go.
    trace/TraceSink.h
    trace/Trace.h
    # The host platform layer's public API and what it includes.
    host/platform/HostEnvironment.h
    host/platform/HostProperties.h
    host/platform/LaunchPolicyTable.h
    host/device/DeviceTree.h
    host/device/NodeKind.h
    host/device/NodeMap.h
    host/device/ValueRule.h
    host/record/EventLog.h
    host/record/EventSpool.h
    host/record/Timeline.h
    host/record/TimelineTraceSink.h
    host/time/HostClock.h)
