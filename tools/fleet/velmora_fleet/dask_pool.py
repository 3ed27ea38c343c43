"""The same per-session work submitted to an existing Dask distributed cluster. The workers
need velmora-replay, the sessions and the configurations at the same paths as here (a shared
or identical file system); run_session's module is shipped to them by value, so they need no
velmora Python code of their own."""
from velmora_fleet import session_run


class ClusterError(Exception):
    """The scheduler cannot be reached or Dask is missing: one line for the user."""


def run_dask(jobs, address, on_done):
    try:
        import cloudpickle
        import distributed
    except ImportError:
        raise ClusterError("--scheduler needs Dask's distributed (Debian: python3-distributed)")
    cloudpickle.register_pickle_by_value(session_run)
    try:
        client = distributed.Client(address, timeout="10s")
    except (OSError, TimeoutError) as err:
        raise ClusterError("cannot reach the Dask scheduler at %s: %s" % (address, err))
    results = []
    try:
        futures = client.map(session_run.run_session, jobs, pure=False)
        for future in distributed.as_completed(futures):
            results.append(future.result())
            on_done()
    finally:
        client.close()
    return results
