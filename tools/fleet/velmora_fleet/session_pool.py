"""Where the sessions run: on this machine's cores (the embedded default) or on an existing
Dask distributed cluster. Both call session_run.run_session for every job, so a session gives
the same result wherever it ran; results come back in the order they finish."""
import concurrent.futures

from velmora_fleet import session_run


class ClusterError(Exception):
    """The scheduler cannot be reached or Dask is missing: one line for the user."""


class SessionPool:
    @staticmethod
    def local(jobs, workers, on_done):
        """`workers` replays at a time, each a process waited on by a thread of its own (the
        threads only wait). The results list is only touched by the calling thread."""
        results = []
        with concurrent.futures.ThreadPoolExecutor(max_workers=workers) as pool:
            futures = [pool.submit(session_run.run_session, job) for job in jobs]
            try:
                for future in concurrent.futures.as_completed(futures):
                    results.append(future.result())
                    on_done()
            except KeyboardInterrupt:
                for future in futures:
                    future.cancel()
                raise
        return results

    @staticmethod
    def dask(jobs, address, on_done):
        """One task per session on the cluster at `address`. The workers need velmora-replay,
        the sessions and the configurations at the same paths as here (a shared or identical
        file system); session_run is shipped to them by value, so they need no velmora Python
        code of their own, only the standard library and Dask's distributed."""
        try:
            import cloudpickle
            import distributed
        except ImportError:
            raise ClusterError(
                "--scheduler needs Dask's distributed (Debian: python3-distributed)")
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
