"""A namespace in which a test changes what the machine looks like. Needs no rights, but a kernel that
permits namespaces to users."""

import shutil
import subprocess


def why_no_namespace():
    """Returns why there can be no namespace; None if there can."""
    for tool in ("unshare", "nsenter", "mount"):
        if shutil.which(tool) is None:
            return f"there is no {tool}"
    done = subprocess.run(["unshare", "--user", "--map-root-user", "--mount", "mount", "-t", "tmpfs",
                           "none", "/mnt"], stdout=subprocess.DEVNULL, stderr=subprocess.PIPE,
                          check=False)
    return None if done.returncode == 0 else f"no namespaces: {done.stderr.decode().strip()}"


class Namespace:
    """File systems that are mounted for the programs of a test alone. The user is its root."""

    def __enter__(self):
        self.holder = subprocess.Popen(
            ["unshare", "--user", "--map-root-user", "--mount", "sh", "-c", "echo; exec cat"],
            stdin=subprocess.PIPE, stdout=subprocess.PIPE)
        assert self.holder.stdout.readline() == b"\n"
        return self

    def __exit__(self, *_):
        self.holder.communicate()

    @property
    def around(self):
        """The command that runs another one in the namespace."""
        return ["nsenter", "--target", str(self.holder.pid), "--user", "--mount",
                "--preserve-credentials"]

    def run(self, *words, check=True):
        subprocess.run([*self.around, *map(str, words)], check=check, stderr=subprocess.DEVNULL)

    def mount(self, *arguments):
        self.run("mount", *arguments)

    def cover(self, path, replacement):
        """Replaces a file or a folder by another one."""
        self.mount("--bind", replacement, path)
