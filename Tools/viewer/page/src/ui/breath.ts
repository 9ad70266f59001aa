// Lets everything else go on before long work does. Timers would wait longer the more often they are asked.

const channel = new MessageChannel();
const waiting: (() => void)[] = [];
/// An open port keeps a program in Node from ending, as it should while somebody waits.
const port: MessagePort & { ref?: () => void; unref?: () => void } = channel.port1;
port.onmessage = () => {
  waiting.shift()?.();
  if (waiting.length === 0) port.unref?.();
};
port.unref?.();

export function breath(): Promise<void> {
  return new Promise((done) => {
    waiting.push(done);
    port.ref?.();
    channel.port2.postMessage(null);
  });
}
