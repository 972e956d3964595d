"""What can go wrong in a driver call, as lines of a driver script; and for which calls that makes
sense."""

from dataclasses import dataclass, field

MEBIBYTE = 1 << 20
ABSURD = 2**31 - 1

# What a caller gets. A call that isn't here yet fails the sweep.
GIVES = {
    "nothing": {
        "glAttachShader", "glBindFramebuffer", "glBindTexture", "glClear", "glClearColor",
        "glCompileShader", "glDeleteFramebuffers", "glDeleteProgram", "glDeleteShader",
        "glDeleteTextures", "glFramebufferTexture2D", "glLinkProgram", "glShaderSource",
        "glTexImage2D", "glTexParameteri"},
    # 0 is a failure that EGL has no error for.
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


def gives(name):
    kinds = [kind for kind, names in GIVES.items() if name in names]
    assert len(kinds) == 1, f"{name} must stand in one row of GIVES"
    return kinds[0]


def library_of(name):
    return name[:3] if name.startswith("egl") else name[:2]


@dataclass
class Fault:
    name: str
    # What the call does; "{error}" is an error of its library.
    action: str
    # How a run ends by it: a signal's name, "hang", or "_exit"; None if it goes on.
    ends: str = None
    # Reasons by what a call gives.
    inapplicable: tuple = ()
    # The text that the call gives.
    text: str = None
    # How many processes outlive a run.
    leaves: int = 0
    # The lines that the call puts between those of the report.
    prints: list = field(default_factory=list, repr=False)

    def why_not(self, call):
        """Why the fault makes no sense for the call; None if it does."""
        return dict(self.inapplicable).get(gives(call.name))

    def rules(self, call):
        """Lines of the script of the call's driver."""
        actions = self.action.format(error=ERRORS[library_of(call.name)]).split("\n")
        numbers = [call.number]
        # The size of a text, and then the text: a lie must be told twice.
        if self.text is not None and call.arguments.endswith("0 null"):
            numbers.append(call.number + 1)
        return "".join(f"at {number} any {action}\n" for number in numbers for action in actions)


def _but(reason, *kinds):
    return tuple((kind, reason) for kind in kinds)


NO_NUMBER = _but("gives no number", "nothing", "success", "status", "handle", "text")
NO_TEXT = _but("gives no text", "nothing", "success", "status", "handle", "number")
NOTHING_NULL = (_but("gives nothing that could be null", "nothing")
                + _but("its 0 is success", "status"))
FOREIGN_BYTES = "\udcff\udcfe\udc80\udcc3(\udced\udca0\udc80\udcf4\udc90\udc80\udc80"
FLOOD_LINES = 30_000  # more than a host keeps

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
    # One line that is too long to keep, and then more lines than are kept.
    Fault("flood", f"flood 1 1 {MEBIBYTE}\nflood 1 {FLOOD_LINES} 1",
          prints=["f" * MEBIBYTE] + ["f"] * FLOOD_LINES),
    Fault("grandchild", "grandchild", leaves=1),
]}
