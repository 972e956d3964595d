"""The faults that a driver call can have, as lines of a driver script, and the calls to which each
applies."""

from dataclasses import dataclass, field

MEBIBYTE = 1 << 20
ABSURD = 2**31 - 1

# The entry points by their kind of result. A call that isn't listed fails the sweep.
RESULTS = {
    "nothing": {
        "glAttachShader", "glBindFramebuffer", "glBindTexture", "glClear", "glClearColor",
        "glCompileShader", "glDeleteFramebuffers", "glDeleteProgram", "glDeleteShader",
        "glDeleteTextures", "glFramebufferTexture2D", "glLinkProgram", "glShaderSource",
        "glTexImage2D", "glTexParameteri"},
    # 0 is a failure, for which EGL has no error.
    "success": {
        "eglBindAPI", "eglDestroyContext", "eglDestroySurface", "eglInitialize", "eglMakeCurrent"},
    # 0 is success.
    "status": {
        "clBuildProgram", "clFinish", "clReleaseCommandQueue", "clReleaseContext", "clReleaseEvent",
        "clReleaseMemObject", "clSetKernelArg", "clWaitForEvents"},
    "handle": {
        "clCreateBuffer", "clCreateCommandQueue", "clCreateContext", "clCreateKernel",
        "clCreateProgramWithSource", "clEnqueueCopyBuffer", "clEnqueueNDRangeKernel",
        "eglCreateContext", "eglCreatePbufferSurface", "eglGetPlatformDisplayEXT",
        "eglGetProcAddress"},
    "number": {
        "clGetDeviceIDs", "clGetEventProfilingInfo", "clIcdGetPlatformIDsKHR", "eglChooseConfig",
        "eglQueryDevicesEXT",
        "glCheckFramebufferStatus", "glCreateProgram", "glCreateShader", "glGenFramebuffers",
        "glGenTextures", "glGetError", "glGetIntegerv", "glGetProgramiv", "glGetProgramivARB",
        "glGetShaderiv"},
    "text": {"eglQueryDeviceStringEXT", "eglQueryString", "glGetString", "glGetStringi"},
    "text and size": {"clGetDeviceInfo", "clGetPlatformInfo"},
}

ERRORS = {"egl": "EGL_BAD_ALLOC", "gl": "GL_OUT_OF_MEMORY", "cl": "CL_OUT_OF_RESOURCES"}


def result_of(name):
    kinds = [kind for kind, names in RESULTS.items() if name in names]
    assert len(kinds) == 1, f"{name} must be in one row of RESULTS"
    return kinds[0]


def library_of(name):
    return name[:3] if name.startswith("egl") else name[:2]


@dataclass
class Fault:
    name: str
    # The action of the call; "{error}" is replaced by an error of its library.
    action: str
    # How the run ends: a signal's name, "hang", or "_exit"; None if it continues.
    ends: str = None
    # Kinds of result to which the fault doesn't apply, each with the reason.
    inapplicable: tuple = ()
    # The text that the call returns.
    text: str = None
    # The number of processes that outlive the run.
    leaves: int = 0
    # The lines that the call prints between those of the report.
    prints: list = field(default_factory=list, repr=False)

    def why_not(self, call):
        """The reason why the fault doesn't apply to the call; None if it does."""
        return dict(self.inapplicable).get(result_of(call.name))

    def rules(self, call):
        """The lines for the script of the call's driver."""
        actions = self.action.format(error=ERRORS[library_of(call.name)]).split("\n")
        numbers = [call.number]
        # The size of a text and the text itself are two calls, and both must have the fault.
        if self.text is not None and call.arguments.endswith("0 null"):
            numbers.append(call.number + 1)
        return "".join(f"at {number} any {action}\n" for number in numbers for action in actions)


def _but(reason, *kinds):
    return tuple((kind, reason) for kind in kinds)


NO_NUMBER = _but("returns no number", "nothing", "success", "status", "handle", "text")
NO_TEXT = _but("returns no text", "nothing", "success", "status", "handle", "number")
NOTHING_NULL = (_but("returns nothing", "nothing")
                + _but("its 0 is success", "status"))
FOREIGN_BYTES = "\udcff\udcfe\udc80\udcc3(\udced\udca0\udc80\udcf4\udc90\udc80\udc80"
FLOOD_LINES = 30_000  # more than assay-host keeps

FAULTS = {fault.name: fault for fault in [
    Fault("SIGSEGV", "crash", ends="SIGSEGV"),
    Fault("abort", "abort", ends="SIGABRT"),
    Fault("hang", "hang", ends="hang"),
    Fault("_exit(0)", "_exit 0", ends="_exit"),
    Fault("null", "return 0", inapplicable=NOTHING_NULL),
    Fault("error", "error {error}"),
    Fault("absurd count", f"claim {ABSURD}", inapplicable=NO_NUMBER),
    Fault("text of 1 MiB", f'text repeat {MEBIBYTE} "t"', inapplicable=NO_TEXT,
          text="t" * MEBIBYTE),
    Fault("not UTF-8", 'text "' + "".join(
        f"\\x{byte:02X}" for byte in FOREIGN_BYTES.encode("utf-8", "surrogateescape")) + '"',
          inapplicable=NO_TEXT, text=FOREIGN_BYTES),
    Fault("exception", 'throw "thrown by the driver"'),
    Fault("exception of another kind", "throw int 5"),
    # A line beyond the limit of assay-host, and then more lines than its limit.
    Fault("flood", f"flood 1 1 {MEBIBYTE}\nflood 1 {FLOOD_LINES} 1",
          prints=["f" * MEBIBYTE] + ["f"] * FLOOD_LINES),
    Fault("grandchild", "grandchild", leaves=1),
]}
